/*
 * The demo platform's native executable, <base>/linux/x86/eclipse.
 *
 *     eclipse [PLATFORM WORD...] [-vm JVM] [-startup ARCHIVE] [-vmargs JVM WORD...]
 *
 * It becomes the JVM that runs the platform's launcher archive. "-vm", "-startup" and "-vmargs" are
 * its own; every other word before "-vmargs" (-data, -configuration, -application, -useDaemon and
 * whatever the user typed) belongs to the platform and goes behind the main class, in its order.
 *
 * It replaces itself by the JVM, so the process number that velmora recorded stays the platform's.
 */
#include <errno.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>
#include <unistd.h>

static const char MAIN_CLASS[] = "org.eclipse.core.launcher.Main";

struct words {
    char** list;
    int count;
};

static void add(struct words* words, const char* word)
{
    /* execv promises not to change its words; its declaration only predates const. */
    words->list[words->count++] = (char*)word;
}

static int fail(const char* what, const char* reason)
{
    fprintf(stderr, "eclipse: %s%s%s\n", what, *reason ? ": " : "", reason);
    return 1;
}

int main(int argc, char** argv)
{
    const char* jvm = NULL;
    const char* archive = NULL;
    int jvm_words = argc;
    /* At most our own words come back, with "-cp", the archive, the main class and the end. */
    struct words platform = {calloc((size_t)argc + 1, sizeof(char*)), 0};
    struct words command = {calloc((size_t)argc + 6, sizeof(char*)), 0};
    if (platform.list == NULL || command.list == NULL)
        return fail("no memory left", "");

    for (int i = 1; i < argc; ++i) {
        if (strcmp(argv[i], "-vmargs") == 0) {
            jvm_words = i + 1;
            break;
        }
        if (strcmp(argv[i], "-vm") == 0 && i + 1 < argc)
            jvm = argv[++i];
        else if (strcmp(argv[i], "-startup") == 0 && i + 1 < argc)
            archive = argv[++i];
        else
            add(&platform, argv[i]);
    }
    if (jvm == NULL)
        return fail("no JVM given (-vm)", "");
    if (archive == NULL)
        return fail("no launcher archive given (-startup)", "");

    add(&command, jvm);
    /* A class path among the JVM's words comes later and so takes precedence. */
    add(&command, "-cp");
    add(&command, archive);
    for (int i = jvm_words; i < argc; ++i)
        add(&command, argv[i]);
    add(&command, MAIN_CLASS);
    for (int i = 0; i < platform.count; ++i)
        add(&command, platform.list[i]);

    execv(jvm, command.list);
    return fail(jvm, strerror(errno));
}
