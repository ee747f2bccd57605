package velmora.demo;

import java.nio.file.Path;
import java.util.Map;
import org.eclipse.equinox.app.IApplicationContext;

/** What velmora handed to this process: its words, its system properties, its environment. */
final class Surroundings {
    private final String[] arguments;

    Surroundings(IApplicationContext context) {
        Map<?, ?> given = context.getArguments();
        arguments = (String[]) given.get(IApplicationContext.APPLICATION_ARGS);
    }

    /** The words that are left for the application after the framework took its own. */
    String[] arguments() {
        return arguments.clone();
    }

    /** The word after `option`, or null when the option is absent or comes last. */
    String wordAfter(String option) {
        for (int i = 0; i + 1 < arguments.length; ++i) {
            if (arguments[i].equals(option)) {
                return arguments[i + 1];
            }
        }
        return null;
    }

    boolean has(String option) {
        for (String argument : arguments) {
            if (argument.equals(option)) {
                return true;
            }
        }
        return false;
    }

    /** Where the framework, not velmora, says that the user's data lies. */
    Path workspace() {
        return area("osgi.instance.area");
    }

    Path configurationArea() {
        return area("osgi.configuration.area");
    }

    Path rcpHome() {
        return Path.of(System.getProperty("rcp.home"));
    }

    /** The home directory as velmora sees it; the JVM's user.home comes from the user database. */
    Path home() {
        return Path.of(System.getenv("HOME"));
    }

    private static Path area(String property) {
        // The framework writes these locations as "file:" and the path as it is, nothing encoded.
        return Path.of(System.getProperty(property).substring("file:".length()));
    }
}
