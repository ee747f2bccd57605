import java.io.FileInputStream;
import java.io.InputStream;
import java.util.Properties;
import java.util.TreeMap;

/**
 * Loads a properties file and prints its entries, sorted by key, one a line: key, a tab, value. Both are printed as
 * the four hexadecimal digits of each of their 16-bit characters, so that nothing can change on the way.
 */
public final class ReadBack {
    public static void main(String[] words) throws Exception {
        Properties properties = new Properties();
        try (InputStream in = new FileInputStream(words[0])) {
            properties.load(in);
        }
        StringBuilder out = new StringBuilder();
        for (Object key : new TreeMap<>(properties).keySet()) {
            String value = properties.getProperty((String) key);
            out.append(digits((String) key)).append('\t').append(digits(value)).append('\n');
        }
        System.out.print(out);
    }

    private static String digits(String text) {
        StringBuilder out = new StringBuilder();
        for (char c : text.toCharArray())
            out.append(String.format("%04x", (int) c));
        return out.toString();
    }
}
