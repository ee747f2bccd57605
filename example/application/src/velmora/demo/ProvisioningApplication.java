package velmora.demo;

import java.io.IOException;
import java.io.InputStream;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.List;
import java.util.Properties;
import org.eclipse.equinox.app.IApplication;
import org.eclipse.equinox.app.IApplicationContext;

/**
 * Stands for an update manager: it "installs" nothing, and records in the user's properties that
 * the user's platform is now at the level that the installation asks for, and set up completely.
 */
public final class ProvisioningApplication implements IApplication {
    private static final String LEVEL = "provisioning.manifest.version";
    private static final String COMPLETE = "demo.setup.complete";

    @Override
    public Object start(IApplicationContext context) throws Exception {
        Surroundings given = new Surroundings(context);
        Path userFile = given.configurationArea().resolve("rcpinstall.properties");
        String wanted = load(given.rcpHome().resolve("rcp/velmora.properties")).getProperty(LEVEL);
        String present = load(userFile).getProperty(LEVEL, "(none)");

        Report.say("The provisioning application runs, and was given:");
        Report.show("level of the user", present);
        Report.show("level wanted", wanted);
        Report.show("arguments", (Object[]) given.arguments());

        record(userFile, LEVEL, wanted);
        record(userFile, COMPLETE, "true");
        Report.say("It wrote \"" + LEVEL + "=" + wanted + "\" and \"" + COMPLETE + "=true\".");
        return IApplication.EXIT_OK;
    }

    @Override
    public void stop() {
        // It ends by itself; nobody asks it to.
    }

    private static Properties load(Path file) throws IOException {
        Properties properties = new Properties();
        try (InputStream in = Files.newInputStream(file)) {
            properties.load(in);
        }
        return properties;
    }

    /** Replaces the line of `key`, or adds one; every other line stays as velmora wrote it. */
    private static void record(Path file, String key, String value) throws IOException {
        List<String> lines = new ArrayList<>(Files.readAllLines(file));
        lines.removeIf(line -> line.startsWith(key + "="));
        lines.add(key + "=" + value);
        Files.write(file, lines);
    }
}
