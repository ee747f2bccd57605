package velmora.demo;

import java.io.IOException;
import java.lang.management.ManagementFactory;
import java.nio.file.Files;
import java.nio.file.NoSuchFileException;
import java.nio.file.Path;
import java.util.Map;
import java.util.TreeSet;
import org.eclipse.equinox.app.IApplication;
import org.eclipse.equinox.app.IApplicationContext;

/**
 * The demo's platform: it prints what it was given, does what its words ask for, and ends.
 *
 * <ul>
 * <li>-demoBrief: leaves out what it was given.
 * <li>-demoRestart: asks once for a restart, through "restart.request" in the workspace.
 * <li>-demoLogoffAt N: asks for the end of the session when it runs for the N-th time.
 * <li>-demoStayUntil FILE: stays until FILE exists, so that another start finds it alive.
 * </ul>
 */
public final class PlatformApplication implements IApplication {
    private static final long LONGEST_STAY_MS = 30_000;

    @Override
    public Object start(IApplicationContext context) throws Exception {
        Surroundings given = new Surroundings(context);
        if (given.has("-demoBrief")) {
            Report.say("The platform runs.");
        } else {
            Report.say("The platform runs, and was given:");
            show(given);
        }
        if (given.has("-demoRestart")) {
            askForRestartOnce(given.workspace());
        }
        String logoffAt = given.wordAfter("-demoLogoffAt");
        if (logoffAt != null) {
            countTowardsLogoff(given, Integer.parseInt(logoffAt));
        }
        String leave = given.wordAfter("-demoStayUntil");
        if (leave != null) {
            stayUntil(Path.of(leave));
        }
        return IApplication.EXIT_OK;
    }

    @Override
    public void stop() {
        // It ends by itself; nobody asks it to.
    }

    private static void show(Surroundings given) {
        Report.show("process", ProcessHandle.current().pid());
        Report.show("workspace", given.workspace());
        Report.show("configuration area", given.configurationArea());
        Report.show("rcp.home", given.rcpHome());
        Report.show("install id", System.getProperty("com.vantor.rcp.install.id"));
        Report.show("install config", System.getProperty("rcp.install.config"));
        Report.show("JVM options", jvmOptions());
        Report.show("system properties", entries(System.getProperties(), "demo."));
        Report.show("environment", entries(System.getenv(), "DEMO_", "JAVA_HIGH_ZIPFDS"));
        Report.show("arguments", (Object[]) given.arguments());
    }

    /** The JVM's own options, without the system properties, which make a list of their own. */
    private static Object[] jvmOptions() {
        return ManagementFactory.getRuntimeMXBean().getInputArguments().stream()
                .filter(option -> !option.startsWith("-D"))
                .toArray();
    }

    /** "name=value" of all entries whose name begins with one of the prefixes, in order of name. */
    private static Object[] entries(Map<?, ?> map, String... prefixes) {
        TreeSet<String> found = new TreeSet<>();
        map.forEach((name, value) -> {
            for (String prefix : prefixes) {
                if (name.toString().startsWith(prefix)) {
                    found.add(name + "=" + value);
                }
            }
        });
        return found.toArray();
    }

    private static void askForRestartOnce(Path workspace) throws IOException {
        Path asked = workspace.resolve("restart.asked");
        if (Files.exists(asked)) {
            Report.say("This is the restart that it asked for; it does not ask again.");
            return;
        }
        Files.createFile(asked);
        // Whoever waits for the request must never read half of it.
        Path draft = workspace.resolve("restart.request.new");
        Files.writeString(draft, Long.toString(ProcessHandle.current().pid()));
        Files.move(draft, workspace.resolve("restart.request"));
        Report.say("It asks to be restarted.");
    }

    private static void countTowardsLogoff(Surroundings given, int logoffAt) throws IOException {
        Path counter = given.workspace().resolve("demo.runs");
        int run = 1;
        try {
            // Not asked for first: access(2), which Files.exists uses, denies what a user may open
            // who is let into root's directories by a capability alone.
            run += Integer.parseInt(Files.readString(counter));
        } catch (NoSuchFileException absent) {
            // It is the first run.
        }
        Files.writeString(counter, Integer.toString(run));
        if (run < logoffAt) {
            Report.say("Run " + run + ": it ends without a word, as after a crash.");
            return;
        }
        // The word alone: with a line end it would be another word.
        Files.writeString(given.home().resolve(".exitData"), "logoff");
        Report.say("Run " + run
                + ": it asks for the end of the session (\"logoff\" in ~/.exitData).");
    }

    private static void stayUntil(Path leave) throws InterruptedException {
        System.out.flush();
        long end = System.nanoTime() + LONGEST_STAY_MS * 1_000_000;
        while (!Files.exists(leave) && System.nanoTime() < end) {
            Thread.sleep(10);
        }
    }
}
