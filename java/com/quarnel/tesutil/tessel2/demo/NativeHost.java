package com.quarnel.tesutil.tessel2.demo;

/**
 * The native side that, in the tool, the native modules provide: a message manager that
 * writes the process's messages to the standard error stream, and the debug level of the
 * root logger. Without it the bridge's messages are dispatched but nobody writes them.
 *
 * <p>The host library is loaded from the path in the system property {@code tesu.host.library}
 * when it is set, otherwise by name ({@code TesuJavaHost}) from {@code java.library.path}.
 */
public final class NativeHost {
    /** System property naming the host library's file, overriding the search by name. */
    public static final String LIBRARY_PROPERTY = "tesu.host.library";

    static {
        String path = System.getProperty(LIBRARY_PROPERTY);
        if (path != null && !path.isEmpty()) {
            System.load(path);
        } else {
            System.loadLibrary("TesuJavaHost");
        }
    }

    private NativeHost() {}

    /**
     * Makes the process's message manager at {@code diagLevel} (0 silent, 1 reduced, 2
     * standard, 3 full; other values act as standard) if there is none at that level yet, and
     * sets the root debug logger to {@code debugLevel} (1 off, 2 normal, 3 detailed, 4
     * verbose; values below 1 act as off). The manager lives until the process ends.
     */
    public static native void start(int diagLevel, int debugLevel);
}
