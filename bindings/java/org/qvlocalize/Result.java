package org.qvlocalize;

import java.nio.ByteBuffer;
import java.nio.ByteOrder;
import java.util.ArrayList;
import java.util.List;
import java.util.Objects;

/**
 * What a search found, the best match first. Later changes of the index do not affect it. The
 * matches are read in the library's memory, which only close releases. Any thread may call.
 */
public final class Result implements AutoCloseable {
    /** The matches of an empty text with one index character. */
    public static final class Section {
        private final char label;
        private final int first;
        private final int count;

        private Section(char label, int first, int count) {
            this.label = label;
            this.first = first;
            this.count = count;
        }

        /** The index character. */
        public char label() {
            return label;
        }

        /** The place of the first of the matches. */
        public int first() {
            return first;
        }

        /** How many there are. */
        public int count() {
            return count;
        }
    }

    // The layout of a match in the library.
    private static final int MATCH_BYTES = 88;
    private static final int CONTACT_ID = 0;
    private static final int NAME_ORDER = 4;
    private static final int LAST = 72;
    private static final int FIRST = 74;
    private static final int INDEX_CHARACTER = 76;
    private static final int LAST_CONTACTED = 80;

    private static final int SECTION_FIELDS = 3;
    private static final String KEYS = "abcdefghijklmnopqrstuvwxyz#";

    private long handle;
    private ByteBuffer matches; // null when there are none, and after close
    private final int size;

    Result(long handle) {
        this.handle = handle;
        final ByteBuffer found = matches(handle);
        matches = found != null ? found.order(ByteOrder.LITTLE_ENDIAN) : null;
        size = found != null ? found.capacity() / MATCH_BYTES : 0;
    }

    /** Releases the matches; the result cannot be used any more. */
    @Override
    public synchronized void close() {
        final long closed = handle;
        handle = 0;
        matches = null;
        free(closed);
    }

    long handle() {
        if (handle == 0) {
            throw new IllegalStateException("the result is closed");
        }
        return handle;
    }

    // Where the field of a match lies; there are matches whenever a place is in range.
    private int at(int place, int field) {
        handle();
        return Objects.checkIndex(place, size) * MATCH_BYTES + field;
    }

    /** The number of matches. */
    public synchronized int size() {
        handle();
        return size;
    }

    /** The id of a contact. */
    public synchronized int contactId(int place) {
        return matches.getInt(at(place, CONTACT_ID));
    }

    /** Its place among all contacts in name order. */
    public synchronized int nameOrder(int place) {
        return matches.getInt(at(place, NAME_ORDER));
    }

    /** The first matched character of its name, counted from 0; 0 for an empty text. */
    public synchronized int first(int place) {
        return Short.toUnsignedInt(matches.getShort(at(place, FIRST)));
    }

    /** The last matched character of its name; 0 for an empty text. */
    public synchronized int last(int place) {
        return Short.toUnsignedInt(matches.getShort(at(place, LAST)));
    }

    /** For an empty text 'A' to 'Z' or '#', in time order '1' to '5'; else 0. */
    public synchronized char indexCharacter(int place) {
        return (char) matches.getInt(at(place, INDEX_CHARACTER));
    }

    /** When it was contacted last, in milliseconds since 1970, UTC; 0 for never. */
    public synchronized long lastContacted(int place) {
        return matches.getLong(at(place, LAST_CONTACTED));
    }

    /** The place of a contact, -1 when it is not among the matches. */
    public synchronized int find(int contactId) {
        return find(handle(), contactId);
    }

    /** The letters that can usefully be typed next, and '#' for digits and other characters. */
    public synchronized String nextKeys() {
        final int mask = nextKeys(handle());
        final StringBuilder keys = new StringBuilder();
        for (int bit = 0; bit < KEYS.length(); ++bit) {
            if ((mask >> bit & 1) != 0) {
                keys.append(KEYS.charAt(bit));
            }
        }
        return keys.toString();
    }

    /** The Chinese characters that the last typed letters may stand for, at most 20. */
    public synchronized String candidates() {
        return candidates(handle());
    }

    /** The sections of an empty text's matches; none for any other text. */
    public synchronized List<Section> sections() {
        final int[] fields = sections(handle());
        final List<Section> sections = new ArrayList<>();
        for (int i = 0; i < fields.length; i += SECTION_FIELDS) {
            sections.add(new Section((char) fields[i], fields[i + 1], fields[i + 2]));
        }
        return sections;
    }

    private static native ByteBuffer matches(long result);

    private static native void free(long result);

    private static native int find(long result, int contactId);

    private static native int nextKeys(long result);

    private static native String candidates(long result);

    private static native int[] sections(long result);
}
