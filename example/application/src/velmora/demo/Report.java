package velmora.demo;

/** Prints named values in two columns; further values of a name stand below its first one. */
final class Report {
    private static final String MARGIN = "    ";
    private static final String ROW = MARGIN + "%-20s%s%n";

    private Report() {
    }

    static void say(String sentence) {
        System.out.println(sentence);
    }

    static void show(String name, Object... values) {
        if (values.length == 0) {
            System.out.printf(ROW, name, "(none)");
        }
        for (int i = 0; i < values.length; ++i) {
            System.out.printf(ROW, i == 0 ? name : "", values[i]);
        }
    }
}
