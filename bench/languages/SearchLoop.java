import java.io.BufferedReader;
import java.io.IOException;
import java.io.InputStreamReader;
import org.qvlocalize.Index;
import org.qvlocalize.Result;

/** What SearchLoop.cpp does, through the Java classes. */
final class SearchLoop {
    private static final int FIRST_PAGE = 20;

    private static long searchOnce(Index index, String text) {
        long sum = 0;
        try (Result result = index.search(text, Index.Kind.WORD)) {
            final int count = Math.min(FIRST_PAGE, result.size());
            for (int i = 0; i < count; ++i) {
                sum += result.contactId(i);
            }
        }
        return sum;
    }

    public static void main(String[] arguments) throws IOException {
        final BufferedReader input = new BufferedReader(new InputStreamReader(System.in));
        try (Index index = new Index(arguments[0])) {
            for (String line = input.readLine(); line != null; line = input.readLine()) {
                final int searches = Integer.parseInt(line);
                long sum = 0;
                final long begin = System.nanoTime();
                for (int i = 0; i < searches; ++i) {
                    sum += searchOnce(index, arguments[1 + i % (arguments.length - 1)]);
                }
                System.out.println((System.nanoTime() - begin) + " " + sum);
            }
        }
    }
}
