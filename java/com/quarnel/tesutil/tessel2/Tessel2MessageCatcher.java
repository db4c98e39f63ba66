package com.quarnel.tesutil.tessel2;

/**
 * Hands the Java side's info, warning, error and debug texts to the native message system of
 * libTesu_Utilities.
 *
 * <p>Info, warning and error texts become status, warning and error messages of the
 * application "tesutil", written by whatever message managers the process's native modules
 * have set up (for example to the standard error stream). Debug texts go to the native debug
 * logger "javavm" at normal level and are written only when that logger's level allows. Texts
 * are passed on exactly as given; a null text is ignored. The methods report nothing back.
 *
 * <p>Loading the class loads the native library: from the path in the system property
 * {@code tesu.library} when it is set, otherwise by name ({@code Tesu_Utilities}) from
 * {@code java.library.path}. An {@link UnsatisfiedLinkError} is thrown when it cannot be
 * loaded.
 */
public class Tessel2MessageCatcher {
    /** System property naming the native library's file, overriding the search by name. */
    public static final String LIBRARY_PROPERTY = "tesu.library";

    static {
        String path = System.getProperty(LIBRARY_PROPERTY);
        if (path != null && !path.isEmpty()) {
            System.load(path);
        } else {
            System.loadLibrary("Tesu_Utilities");
        }
    }

    /** Issues {@code text} as a status (info) message. */
    public native void outputInfoMessageN(String text);

    /** Issues {@code text} as a warning message. */
    public native void outputWarningMessageN(String text);

    /** Issues {@code text} as an error message. */
    public native void outputErrorMessageN(String text);

    /** Writes {@code text} to the debug logger "javavm" at normal level. */
    public native void outputDebugMessageN(String text);
}
