/*
 * A C program for just one start: the warm start of the example's installation, in the user's
 * locale. It makes the calls of that start, understands what it reads, and leaves what velmora
 * leaves. Of every other start it knows nothing: it ends it, or gets it wrong.
 *
 *     plain LAUNCHER     the path of the launcher in whose place it stands
 */
#define _GNU_SOURCE
#include "calls.h"
#include "texts.h"

#include <locale.h>
#include <signal.h>
#include <sys/time.h>
#include <time.h>

enum { FULL_HISTORY = 200 };

static struct pairs user, arguments, jvm;
static char* words[MOST];
static size_t word_count;

/* Lines of the log, until they are written at once. */
static char lines[2 * PIECE], *next_line = lines;

static void say(const char* format, const char* what)
{
    size_t room = (size_t)(lines + sizeof lines - next_line);
    int length = snprintf(next_line, room, format, what);
    if (length < 0 || (size_t)length >= room)
        exit(1);
    next_line += length;
}

static void write_lines(int log)
{
    put(log, lines);
    next_line = lines;
}

static void say_when(const char* format)
{
    struct timeval now;
    struct tm broken;
    char day[40], all[60];
    gettimeofday(&now, NULL);
    localtime_r(&now.tv_sec, &broken);
    strftime(day, sizeof day, "%Y%m%d_%H%M%S", &broken);
    snprintf(all, sizeof all, "%s_%03d", day, (int)(now.tv_usec / 1000));
    say(format, all);
}

/* The directory that holds "rcp": every path begins with it. */
static char* find_installation(const char* self)
{
    char* folder = narrow(widen(self));
    if (readlink("/proc/self/exe", text, PIECE) < 0)
        exit(1);
    for (int level = 0; level < 2; level++) {
        *strrchr(folder, '/') = 0;
        ask_folder(folder);
    }
    install_dir = widen(folder);
    read_pairs(below(folder, "rcp/velmora.properties"), &launcher);
    ask(below(folder, "rcp/prov.debug/debug.txt"));
    return folder;
}

static const wchar_t* find_workspace(void)
{
    const wchar_t* root =
        joined(widen(getenv("HOME")), L"/VANTOR/RCP/", find(&launcher, L"rcp.install.id"));
    return joined(root, L"/", widen(getenv("USER")));
}

static int take_lock(const char* area)
{
    ask_folder(area);
    int lock = locked(below(area, ".rcp.lock"), 0);
    say_when("QVMRL0303I: lock file captured @ %s\n");
    say("QVMRL0090E: Existing platform lock file found - checking validity.%s\n", "");
    int pid = atoi(text);
    if (pid <= 0 || kill(pid, 0) == 0)
        exit(1);
    ask(below(area, ".sid"));
    say("QVMRL0304I: We are main process%s\n\n", "");
    return lock;
}

static int open_log(const char* area)
{
    ask_folder(below(area, "logs"));
    int log = opened(below(area, "logs/velmora.log"), O_WRONLY | O_CREAT | O_TRUNC);
    write_lines(log);
    ask("/tmp/velmora.log");
    return log;
}

static void read_user(const char* app, const char* area, const char* self, int argc)
{
    ask_folder(below(area, ".config"));
    read_pairs(below(area, ".config/rcpinstall.properties"), &user);
    if (wcscmp(find(&user, L"rcp.install.id"), find(&launcher, L"rcp.install.id")) != 0)
        exit(1);
    ask_folder(below(area, "applications/eclipse/features"));
    ask_folder(below(area, "applications/eclipse/plugins"));
    ask(below(app, "shared/eclipse/.eclipseextension"));
    snprintf(text, PIECE, "arg0=%s\nargc=%d\ncom.vantor.rcp.core.internal.librarypath=\n", self,
             argc);
    write_text(below(area, ".config/args.properties"), O_TRUNC, text);
    ask(below(area, ".config/config.ini"));
    read_pairs(below(area, ".config/args.properties"), &arguments);
}

static const wchar_t* read_jvm(int log)
{
    const wchar_t* java = resolved(find(&user, L"vm"));
    say("QVMRL0021I: VM specified is \"%s\"\n", narrow(java));
    write_lines(log);
    const wchar_t* within = wcsstr(java, L"jre/bin/java");
    if (!within)
        exit(1);
    wchar_t* plug_in = wide_room((size_t)(within - java));
    wmemcpy(plug_in, java, (size_t)(within - java))[within - java] = 0;
    const char* path = narrow(join(plug_in, L"jvm.properties"));
    ask(path);
    say("QVMRL0077I: loading jvm.properties at \"%s\"\n", path);
    write_lines(log);
    read_pairs(path, &jvm);
    return java;
}

static void tell_start(const char* area)
{
    time_t now = time(NULL);
    struct tm broken;
    strftime(text, PIECE, "Started %c\n", localtime_r(&now, &broken));
    write_text(below(area, "logs/shutdown.log"), O_APPEND, text);
    read_history(below(area, "logs/shutdown.log"));
    size_t count = 0;
    for (const char* end = text; (end = strchr(end, '\n')); end++)
        count++;
    if (count >= FULL_HISTORY)
        exit(1);
}

static void add(const wchar_t* word)
{
    if (word_count == MOST - 1)
        exit(1);
    words[word_count++] = narrow(word);
}

static void add_two(const wchar_t* name, const wchar_t* value)
{
    add(name);
    add(value);
}

static void add_definitions(const wchar_t* workspace)
{
    add(find(&jvm, L"vmarg.greeting"));
    add(join(L"-Drcp.home=", install_dir));
    add(join(L"-Drcp.data=", workspace));
    add(join(L"-Dcom.vantor.rcp.install.id=", find(&launcher, L"rcp.install.id")));
    add(join(L"-Drcp.install.config=", find(&launcher, L"install.configuration")));
    for (size_t i = 0; i < user.count; i++) {
        if (wcsncmp(user.all[i].key, L"-D", 2) == 0)
            add(joined(user.all[i].key, L"=", resolved(user.all[i].value)));
    }
    add(joined(L"-Drcp.osgi.install.area=", install_dir, L"/rcp/eclipse"));
}

static void add_words(const wchar_t* workspace, const wchar_t* java)
{
    const wchar_t* base = resolved(find(&launcher, L"rcp.base.location"));
    add(join(base, L"/linux/x86/eclipse"));
    ask_program(words[0]);
    add(L"--launcher.suppressErrors");
    add_two(L"-data", workspace);
    add_two(L"-configuration", join(workspace, L"/.config"));
    add_two(L"-application", find(&user, L"application"));
    add_two(L"-vm", java);
    add_two(L"-startup", join(base, L"/launcher.jar"));
    add(L"-vmargs");
    add_definitions(workspace);
    for (size_t i = 0; i < jvm.count; i++) {
        if (jvm.all[i].key[0] == L'-')
            add(jvm.all[i].value[0] ? joined(jvm.all[i].key, L"=", jvm.all[i].value)
                                    : jvm.all[i].key);
    }
    add_two(L"-cp", resolved(find(&user, L"cp")));
}

static void say_words(int log)
{
    say("QVMRL0132I: ===== Begin Launch Parameters =====%s\n", "");
    for (size_t i = 0; i < word_count; i++)
        say("%s\n", words[i]);
    say("QVMRL0133I: ===== End Launch Parameters =====%s\n", "");
    write_lines(log);
}

static void set_environment(void)
{
    setenv("JAVA_HIGH_ZIPFDS", "500", 1);
    for (size_t i = 0; i < user.count; i++) {
        const struct pair* one = &user.all[i];
        if (wcsncmp(one->key, L"env.set.", 8) == 0)
            setenv(narrow(one->key + 8), narrow(resolved(one->value)), 1);
        else if (wcsncmp(one->key, L"env.unset.", 10) == 0)
            unsetenv(narrow(one->key + 10));
    }
}

int main(int argc, char** argv)
{
    if (argc != 2 || !setlocale(LC_CTYPE, ""))
        return 1;
    const char* self = narrow(widen(argv[1]));
    say("QVMRL0030I: velmora main arguments=\"%s, \"\n\n", self);
    const char* app = find_installation(self);
    const wchar_t* workspace = find_workspace();
    const char* area = narrow(workspace);
    int lock = take_lock(area), log = open_log(area);
    read_user(app, area, self, argc - 1);
    const wchar_t* java = read_jvm(log);
    ask_folder(below(area, ".config/org.eclipse.update"));
    ask(below(area, ".config/org.eclipse.update/platform.xml"));
    tell_start(area);
    add_words(workspace, java);
    say_words(log);
    set_environment();
    record(area, lock, start(words));
    if (flock(lock, LOCK_UN) != 0)
        return 1;
    say_when("QVMRL0306I: lock file released @ %s\n");
    write_lines(log);
    return 0;
}
