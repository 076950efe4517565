package org.qvlocalize;

/** A failure of the library, with its description. */
public final class QvException extends RuntimeException {
    private static final long serialVersionUID = 1;

    /** The values of {@link #code}; qvlocalize.h describes them. */
    public static final int ARGUMENT = -1;
    public static final int MEMORY = -2;
    public static final int UTF8 = -3;
    public static final int TOO_LONG = -4;
    public static final int BUFFER = -5;
    public static final int DIRECTORY = -6;
    public static final int OTHER_DIRECTORY = -7;
    public static final int DATABASE = -8;
    public static final int PINYIN = -9;
    public static final int STORE = -10;
    public static final int CHARACTER = -11;
    public static final int NOT_BUILT = -12;
    public static final int PLATFORM = -13;

    private final int code;

    QvException(int code, String words) {
        super(words);
        this.code = code;
    }

    /** The library's result, one of the constants. */
    public int code() {
        return code;
    }
}
