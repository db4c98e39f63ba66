package com.quarnel.tesutil.tessel2.check;

import com.quarnel.tesutil.tessel2.Tessel2MessageCatcher;
import com.quarnel.tesutil.tessel2.demo.NativeHost;

/**
 * Sends a fixed series of texts through the four native methods in a real JVM; the CTest
 * script compares what reaches standard error with the lines it expects. Writes nothing of its
 * own to standard error.
 */
public final class BridgeCheck {
    private BridgeCheck() {}

    public static void main(String[] args) {
        NativeHost.start(2, 2);  // standard diagnostics, debug at normal level
        Tessel2MessageCatcher catcher = new Tessel2MessageCatcher();

        String[] texts = {
            "plain text",
            "",
            "%s%d%n %x %%",
            // Non-ASCII, an embedded NUL and a character outside the BMP.
            "Gr\u00fc\u00dfe \u6f22\u5b57 a\u0000b \ud83d\ude00",
        };
        for (String text : texts) {
            catcher.outputInfoMessageN(text);
            catcher.outputWarningMessageN(text);
            catcher.outputErrorMessageN(text);
            catcher.outputDebugMessageN(text);
        }

        // Between the two markers nothing may be written.
        catcher.outputInfoMessageN("-- null texts and debug off --");
        catcher.outputInfoMessageN(null);
        catcher.outputWarningMessageN(null);
        catcher.outputErrorMessageN(null);
        catcher.outputDebugMessageN(null);
        NativeHost.start(2, 1);
        catcher.outputDebugMessageN("not written: debug is off");
        catcher.outputInfoMessageN("-- end --");
    }
}
