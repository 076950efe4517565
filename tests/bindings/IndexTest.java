import java.util.ArrayList;
import java.util.List;
import java.util.concurrent.ExecutorService;
import java.util.concurrent.Executors;
import java.util.concurrent.Future;
import org.qvlocalize.Index;
import org.qvlocalize.Index.Filter;
import org.qvlocalize.Index.Kind;
import org.qvlocalize.Index.SortType;
import org.qvlocalize.QvException;
import org.qvlocalize.Result;

/**
 * Run by languages_test.py on a sample's index: prints what searches find, for comparison, and fails when
 * anything else is not as it should be.
 */
final class IndexTest {
    private static final String FACE = "\uD83D\uDE00"; // one character of two units

    private static void check(boolean holds, String what) {
        if (!holds) {
            throw new AssertionError(what);
        }
    }

    private static <T extends RuntimeException> T refuses(Class<T> type, Runnable call) {
        try {
            call.run();
        } catch (RuntimeException exception) {
            return type.cast(exception);
        }
        throw new AssertionError("no " + type);
    }

    private static void fails(int code, Runnable call) {
        final QvException exception = refuses(QvException.class, call);
        check(exception.code() == code, "not " + code + " but " + exception.code());
        check(exception.getMessage().length() > 5, "no words");
    }

    private static void print(String text, Result result) {
        System.out.print(text + ":");
        for (int i = 0; i < result.size(); ++i) {
            System.out.printf(" %d,%d,%d,%d,%d,%d", result.contactId(i), result.nameOrder(i),
                    result.lastContacted(i), result.first(i), result.last(i),
                    (int) result.indexCharacter(i));
        }
        System.out.printf(" / %s / %s", result.nextKeys(), result.candidates());
        result.sections().forEach(section -> System.out.printf(" %s%d+%d", section.label(),
                section.first(), section.count()));
        System.out.println();
    }

    private static void search(Index index, String text, Kind kind, Filter... filters) {
        try (Result result = index.search(text, kind, filters)) {
            print(text, result);
        }
    }

    private static void searchAll(Index index) {
        search(index, "", Kind.WORD);
        search(index, "zs", Kind.WORD, Filter.starred());
        search(index, "张s", Kind.WORD, Filter.group(2), Filter.phone());
        search(index, "w", Kind.WORD, Filter.notGroup(1), Filter.notGroup(2), Filter.account(1));
        search(index, "l", Kind.WORD, Filter.mail(), Filter.postal(), Filter.notContact(3));
        search(index, "l", Kind.WORD, Filter.online(), Filter.notAccount(1),
                Filter.notAccount(2));
        search(index, "9426", Kind.DIGITS);
        search(index, "tianqi", Kind.SPECIAL);
        search(index, "z", Kind.WORD, Filter.group(-1));
        try (Result first = index.search("z", Kind.WORD);
                Result second = index.searchWithin(first, "zh", Kind.WORD)) {
            print("zh", second);
            check(first.size() > second.size(), "the result that was searched within");
        }
    }

    private static void checkTexts(Index index) {
        final List<String> names = new ArrayList<>();
        for (int i = 0; i < 100; ++i) {
            names.add(i % 2 == 0 ? FACE + "张三" : "x".repeat(50 * i));
        }
        final List<String> keys = index.localizerKeys(names);
        final String key = index.localizerKey("张三");
        check(key.length() == 2 && keys.get(0).equals("\u5000" + key), "key " + keys.get(0));
        check(keys.get(99).equals("\u4f17".repeat(10)), "key " + keys.get(99));
        check(index.pick("zhangs", 6, "三").equals("ZHANG三"), "pick");
        check(index.pick(FACE + "s", 2, "a").equals(FACE + "SA"), "pick behind a pair");
        search(index, FACE.repeat(10), Kind.WORD);
        fails(QvException.TOO_LONG, () -> index.search(FACE.repeat(11), Kind.WORD));
        fails(QvException.TOO_LONG, () -> index.search("z".repeat(100000), Kind.WORD));
        fails(QvException.CHARACTER, () -> index.pick("z", 1, FACE));
        fails(QvException.ARGUMENT, () -> index.pick("z", -1, "三"));
        for (String text : List.of("\uD83D", "\uDE00", "z\uDE00\uD83D", "\uD83Dz", "z\0")) {
            refuses(IllegalArgumentException.class, () -> index.search(text, Kind.WORD));
            refuses(IllegalArgumentException.class, () -> index.localizerKey(text));
        }
        refuses(NullPointerException.class, () -> index.search(null, Kind.WORD));
        refuses(NullPointerException.class, () -> index.pick("z", 1, null));
        final Filter[] many = new Filter[40];
        for (int i = 0; i < many.length; ++i) {
            many[i] = Filter.notContact(i);
        }
        search(index, "zh", Kind.WORD, many);
    }

    private static void checkChanges(Index index) {
        final Result before = index.search("", Kind.WORD);
        final int contact = before.contactId(0);
        check(before.find(contact) == 0 && before.find(-1) == -1, "find");
        index.starChanged(contact, true);
        try (Result starred = index.search("", Kind.WORD, Filter.starred())) {
            check(starred.find(contact) >= 0, "star");
        }
        index.timeChanged(contact, 1800000000123L);
        index.setSortType(SortType.TIME);
        index.statusChanged();
        check(index.sortType() == SortType.TIME, "sort type");
        try (Result all = index.search("", Kind.WORD)) {
            check(all.size() == before.size() && all.contactId(0) != contact, "rebuilt");
        }
        index.contactsChanged(contact);
        index.contactsChanged();
        index.allContactsChanged();
        check(!index.needsBuild(), "index");
        before.close();
        before.close();
        refuses(IllegalStateException.class, () -> before.contactId(0));
        refuses(IllegalStateException.class, () -> index.searchWithin(before, "z", Kind.WORD));
        try (Result result = index.search("zs", Kind.WORD)) {
            refuses(IndexOutOfBoundsException.class, () -> result.contactId(result.size()));
            refuses(IndexOutOfBoundsException.class, () -> result.first(-1));
        }
    }

    // Searches of many threads on one index, and a result that is closed while it is read.
    private static void checkThreads(Index index) throws Exception {
        final Result shared = index.search("z", Kind.WORD);
        final int expected = shared.size();
        final ExecutorService threads = Executors.newFixedThreadPool(4);
        final List<Future<?>> searches = new ArrayList<>();
        for (int i = 0; i < 200; ++i) {
            final int place = i % expected;
            searches.add(threads.submit(() -> {
                try (Result result = index.search("z", Kind.WORD)) {
                    check(result.size() == expected, "size");
                    shared.contactId(place);
                } catch (IllegalStateException closed) {
                    // by the main thread
                }
            }));
        }
        threads.shutdown(); // once all have searched
        shared.close();
        for (Future<?> search : searches) {
            search.get();
        }
    }

    public static void main(String[] arguments) throws Exception {
        final String directory = arguments[0];
        final Index index = new Index(directory);
        check(index.needsBuild(), "needs no index");
        fails(QvException.NOT_BUILT, () -> index.search("z", Kind.WORD));
        index.build(false);
        searchAll(index);
        checkTexts(index);
        checkThreads(index);
        fails(QvException.OTHER_DIRECTORY, () -> new Index(directory + "/files"));
        fails(QvException.DIRECTORY, () -> new Index(directory + "/none/" + FACE));
        checkChanges(index);
        index.close();
        index.close();
        refuses(IllegalStateException.class, () -> index.search("z", Kind.WORD));
    }
}
