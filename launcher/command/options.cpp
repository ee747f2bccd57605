#include "launcher/command/options.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/argument_vector.h"

#include <cwchar>
#include <cwctype>

static bool hasOption(const wchar_t* option, int argc, wchar_t** argv)
{
    return findOption(option, argc, argv) >= 0;
}

bool isRestart(int argc, wchar_t** argv)
{
    return hasOption(L"-restart", argc, argv);
}

bool isDCommandOnly(int argc, wchar_t** argv)
{
    return hasOption(L"-dcommand_only", argc, argv);
}

bool isInitMUService(int argc, wchar_t** argv)
{
    return hasOption(L"-initMUService", argc, argv);
}

bool isResetConfig(int argc, wchar_t** argv)
{
    return hasOption(L"-resetconfig", argc, argv);
}

bool isVmOverride(int argc, wchar_t** argv)
{
    return hasOption(L"-vm", argc, argv);
}

bool isDebug(int argc, wchar_t** argv)
{
    return hasOption(L"-debug", argc, argv) && !isRestart(argc, argv);
}

bool isISMPProvisioning(int argc, wchar_t** argv)
{
    return hasOption(L"-velmoraWait", argc, argv) && hasOption(L"-provManifest", argc, argv);
}

void doVersionCheck(int argc, wchar_t** argv)
{
    if (argc != 2 || !hasOption(L"-version", argc, argv))
        return;
    // Deliberate: three blanks, and the fatal path, which shows the line and ends the process.
    fatalErrorA("QVMRL0031I:   version = \"%ls\"", L"20131002.1404", EXIT_PROCESS, WITH_ERRNO);
}

// The number that follows "-maxargcnt"; 0 when none does.
static unsigned long declaredCount(int option, int argc, wchar_t** argv)
{
    if (option + 1 >= argc)
        return 0;
    const wchar_t* number = argv[option + 1];
    while (iswspace(static_cast<wint_t>(*number)) != 0)
        ++number;
    // Decision: a number with a minus sign is none. The C library would turn it into a large one,
    // and which that is depends on the width.
    if (*number == L'-')
        return 0;
    return wcstoul(number, nullptr, 10);
}

void validateIfUrlHandlerLaunch(int argc, wchar_t** argv)
{
    const int option = findOption(L"-maxargcnt", argc, argv);
    if (option < 0)
        return;
    const int expected = isRestart(argc, argv) ? argc - 1 : argc;
    if (declaredCount(option, argc, argv) != static_cast<unsigned long>(expected))
        fatalErrorA("QVMRL0069E: velmora invoked with an invalid URL handler action - "
                    "bad argument count.",
                    EXIT_PROCESS, WITH_ERRNO);
}

void validateThatDoubleQuotesNotUsed(int argc, wchar_t** argv)
{
    for (int i = 0; i < argc; ++i) {
        if (wcschr(argv[i], L'"') != nullptr)
            fatalErrorA("QVMRL0089E: velmora invoked with double quote in arg - bad argument.",
                        EXIT_PROCESS, WITH_ERRNO);
    }
}

// Decision: the words are gone through one by one, and the three names within each.
void validateNoJavaLibraryPath(int argc, wchar_t** argv)
{
    for (int i = 0; i < argc; ++i) {
        if (wcsstr(argv[i], L"jvm.library.path") != nullptr)
            fatalErrorA("QVMRL0190E: velmora invoked with arg containing \"jvm.library.path\" - "
                        "not allowed.",
                        EXIT_PROCESS, WITH_ERRNO);
        if (wcsstr(argv[i], L"java.library.path") != nullptr)
            fatalErrorA("QVMRL0191E: velmora invoked with arg containing \"java.library.path\" - "
                        "not allowed.",
                        EXIT_PROCESS, WITH_ERRNO);
        if (wcsstr(argv[i], L"java.home") != nullptr)
            fatalErrorA("QVMRL0192E: velmora invoked with arg containing \"java.home\" - "
                        "not allowed.",
                        EXIT_PROCESS, WITH_ERRNO);
    }
}
