package org.qvlocalize;

import java.util.List;
import java.util.Objects;

/**
 * The index of a data directory: contact search by pinyin, initials and keypad digits.
 *
 * <pre>{@code
 * try (Index index = new Index("/srv/contacts")) {
 *     index.build(false);
 *     try (Result result = index.search("zs", Index.Kind.WORD, Index.Filter.starred())) {
 *         for (int i = 0; i < result.size(); ++i) {
 *             System.out.println(result.contactId(i));
 *         }
 *     }
 * }
 * }</pre>
 *
 * A process has one data directory open at a time. Any thread may call; calls on one index wait for
 * each other. Failures are a {@link QvException}; a string with half a surrogate pair or a null
 * character is an {@link IllegalArgumentException}. An index and its results belong to the caller,
 * who closes them; a result may outlive its index.
 */
public final class Index implements AutoCloseable {
    /** What the typed text is and where it is searched. */
    public enum Kind {
        /** Letters and Chinese characters, among the contacts. */
        WORD,
        /** Keypad digits, among the contacts. */
        DIGITS,
        /** Letters, among the seven fixed special numbers. */
        SPECIAL
    }

    /** The order of the contacts in the index. */
    public enum SortType {
        /** By name in pinyin. */
        NAME,
        /** Last contacted first. */
        TIME
    }

    /** One condition on contacts. */
    public static final class Filter {
        private final int kind;
        private final int id;

        private Filter(int kind, int id) {
            this.kind = kind;
            this.id = id;
        }

        /** Members of the group; group -1: secret contacts. */
        public static Filter group(int id) {
            return new Filter(0, id);
        }

        /** Contacts with data in the account. */
        public static Filter account(int id) {
            return new Filter(1, id);
        }

        /** Contacts with a phone number. */
        public static Filter phone() {
            return new Filter(2, 0);
        }

        /** Favourites. */
        public static Filter starred() {
            return new Filter(5, 0);
        }

        /** Contacts outside the group. */
        public static Filter notGroup(int id) {
            return new Filter(6, id);
        }

        /** Contacts with a mail address. */
        public static Filter mail() {
            return new Filter(7, 0);
        }

        /** Contacts with a postal address. */
        public static Filter postal() {
            return new Filter(8, 0);
        }

        /** Contacts not confined to the accounts of these filters. */
        public static Filter notAccount(int id) {
            return new Filter(9, id);
        }

        /** All contacts but one. */
        public static Filter notContact(int id) {
            return new Filter(10, id);
        }

        /** Contacts that are online. */
        public static Filter online() {
            return new Filter(11, 0);
        }
    }

    static {
        System.loadLibrary("qvlocalize_jni");
    }

    private long handle;

    /** Opens a data directory, which must exist; null is the contacts provider's on Android. */
    public Index(String dataDirectory) {
        handle = open(dataDirectory);
    }

    /** Closes the index; its files stay, and so do its results. */
    @Override
    public synchronized void close() {
        final long closed = handle;
        handle = 0;
        close(closed);
    }

    private long handle() {
        if (handle == 0) {
            throw new IllegalStateException("the index is closed");
        }
        return handle;
    }

    /** Whether there is no index to search yet. */
    public synchronized boolean needsBuild() {
        return needsBuild(handle());
    }

    /** Builds the index from the database, unless force is false and it is complete. */
    public synchronized void build(boolean force) {
        build(handle(), force);
    }

    /**
     * Searches among all contacts that pass the filters for at most ten characters; an empty text
     * lists all of them. The best match comes first.
     */
    public synchronized Result search(String text, Kind kind, Filter... filters) {
        final int[] pairs = new int[2 * filters.length];
        for (int i = 0; i < filters.length; ++i) {
            pairs[2 * i] = filters[i].kind;
            pairs[2 * i + 1] = filters[i].id;
        }
        return new Result(search(handle(), text, kind.ordinal(), pairs, 0));
    }

    /** Searches within an earlier result, which is not changed and stays the caller's. */
    public synchronized Result searchWithin(Result previous, String text, Kind kind) {
        synchronized (Objects.requireNonNull(previous)) {
            return new Result(search(handle(), text, kind.ordinal(), null, previous.handle()));
        }
    }

    /** The key of a name, which the database keeps in localizer.localizerkey. */
    public String localizerKey(String name) {
        return localizerKeys(List.of(name)).get(0);
    }

    /** The keys of many names with one mapping of the pinyin table. */
    public synchronized List<String> localizerKeys(List<String> names) {
        return List.of(localizerKeys(handle(), names.toArray(new String[0])));
    }

    /**
     * The text that is searched after a candidate character was picked for the letters before
     * position, which counts characters and not surrogates.
     */
    public synchronized String pick(String text, int position, String character) {
        return pick(handle(), text, position, character);
    }

    /** These contacts were added, changed or removed, and the database has the change. */
    public synchronized void contactsChanged(long... ids) {
        contactsChanged(handle(), ids);
    }

    /** Any contacts may have changed: rebuilds the index. */
    public synchronized void allContactsChanged() {
        allContactsChanged(handle());
    }

    /** Who is online changed. */
    public synchronized void statusChanged() {
        statusChanged(handle());
    }

    /** The contact was contacted at time, in milliseconds since 1970. */
    public synchronized void timeChanged(int contactId, long time) {
        timeChanged(handle(), contactId, time);
    }

    /** The contact became a favourite or ceased to be one. */
    public synchronized void starChanged(int contactId, boolean starred) {
        starChanged(handle(), contactId, starred);
    }

    /** The order of the index. */
    public synchronized SortType sortType() {
        return SortType.values()[sortType(handle())];
    }

    /** Sets the order for the next build or notification of contacts or status. */
    public synchronized void setSortType(SortType sortType) {
        setSortType(handle(), sortType.ordinal());
    }

    private static native long open(String dataDirectory);

    private static native void close(long index);

    private static native boolean needsBuild(long index);

    private static native void build(long index, boolean force);

    private static native long search(
            long index, String text, int kind, int[] filters, long previous);

    private static native String[] localizerKeys(long index, String[] names);

    private static native String pick(long index, String text, int position, String word);

    private static native void contactsChanged(long index, long[] ids);

    private static native void allContactsChanged(long index);

    private static native void statusChanged(long index);

    private static native void timeChanged(long index, int contactId, long time);

    private static native void starChanged(long index, int contactId, boolean starred);

    private static native int sortType(long index);

    private static native void setSortType(long index, int sortType);
}
