package velmora.demo;

import java.io.IOException;
import java.io.InputStream;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.Collections;
import java.util.List;
import java.util.Properties;

/**
 * Starts a launcher and restarts it as recorded, as soon as its platform asks for that.
 *
 * <p>Usage: Supervisor WORKSPACE LAUNCHER WORD...
 *
 * <p>This is the platform writer's half of a restart: "args.properties" in the configuration area
 * holds the words of the last start, and two more words tell the launcher that this is a restart
 * and which process it must outlive. It runs outside of the platform, which is about to end.
 */
public final class Supervisor {
    private Supervisor() {
    }

    public static void main(String[] args) throws Exception {
        Path workspace = Path.of(args[0]);
        Path request = workspace.resolve("restart.request");
        List<String> command = new ArrayList<>(List.of(args).subList(1, args.length));
        Process launcher = start(command);
        while (launcher.isAlive() && !Files.exists(request)) {
            Thread.sleep(5);
        }
        if (!Files.exists(request)) {
            System.err.println("The platform did not ask for a restart.");
            System.exit(1);
        }
        String oldPlatform = Files.readString(request);
        Files.delete(request);

        List<String> restart = recordedWords(workspace.resolve(".config/args.properties"));
        Collections.addAll(restart, "-restart", "-rcp_old_pid", oldPlatform);
        Process second = start(restart);
        int status = second.waitFor();
        System.exit(launcher.waitFor() != 0 ? launcher.exitValue() : status);
    }

    static List<String> recordedWords(Path file) throws IOException {
        Properties recorded = new Properties();
        try (InputStream in = Files.newInputStream(file)) {
            recorded.load(in);
        }
        int count = Integer.parseInt(recorded.getProperty("argc"));
        List<String> words = new ArrayList<>();
        for (int i = 0; i < count; ++i) {
            words.add(recorded.getProperty("arg" + i));
        }
        return words;
    }

    private static Process start(List<String> command) throws IOException {
        return new ProcessBuilder(command).inheritIO().start();
    }
}
