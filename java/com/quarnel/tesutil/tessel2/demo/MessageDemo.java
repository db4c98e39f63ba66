package com.quarnel.tesutil.tessel2.demo;

import com.quarnel.tesutil.tessel2.Tessel2MessageCatcher;

/**
 * Shows Java texts arriving on the standard error stream through the native message system.
 *
 * <p>Usage: {@code MessageDemo [diagLevel [debugLevel]]}, by default 2 (standard) and 2
 * (normal), so that info, warning, error and debug texts are all written.
 */
public final class MessageDemo {
    private MessageDemo() {}

    public static void main(String[] args) {
        int diagLevel = args.length > 0 ? Integer.parseInt(args[0]) : 2;
        int debugLevel = args.length > 1 ? Integer.parseInt(args[1]) : 2;
        NativeHost.start(diagLevel, debugLevel);

        Tessel2MessageCatcher catcher = new Tessel2MessageCatcher();
        System.out.println("Java texts sent through the native message system"
                + " (diagnostic level " + diagLevel + ", debug level " + debugLevel
                + "); they appear on standard error:");
        System.out.flush();
        catcher.outputInfoMessageN("Info from Java: generating core fir_compiler_v7");
        catcher.outputWarningMessageN("Warning from Java: parameter 'Coefficients' has no value");
        catcher.outputErrorMessageN("Error from Java: cannot write output product");
        catcher.outputDebugMessageN("Debug from Java: session started");
        catcher.outputWarningMessageN("Texts are never formats: 100%s done, %d%n");
        catcher.outputInfoMessageN("Non-ASCII text: Gr\u00fc\u00dfe, \u00e9t\u00e9, \u6f22\u5b57");
    }
}
