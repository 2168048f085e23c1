package com.tarq.vi.player;

/** The live window's keys: each a host event or a control of the window, with the line --help shows. */
enum LiveKeys {
    AFFORDANCE('a', "a", "affordance"),
    UNLOCK('u', "u", "unlock"),
    CLEAR('c', "c", "clear the effect"),
    MENU('m', "m", "the menu key"),
    VOLUME_UP(Codes.UP, "Up", "the volume-up key"),
    VOLUME_DOWN(Codes.DOWN, "Down", "the volume-down key"),
    ORIENTATION('o', "o", "turn to landscape and back"),
    LOSE_CONTEXT('l', "l", "lose the GL context (destroyed, a new one made)"),
    RESTART('r', "r", "restart the effect"),
    PAUSE(' ', "Space", "pause and resume"),
    STEP('n', "n", "one frame while paused"),
    SCREENSHOT('p', "p", "screenshot (live-NNN.png in the current folder)"),
    RELOAD(Codes.F5, "F5", "reload the plug-in now"),
    HELP('h', "h", "print these keys"),
    QUIT('q', "q, Esc", "quit");

    /** SDL's codes of the keys that have no character. */
    private static final class Codes {
        static final int UP = (1 << 30) | 82;
        static final int DOWN = (1 << 30) | 81;
        static final int F5 = (1 << 30) | 62;
        static final int ESCAPE = 27;
    }

    final int code;
    final String key;
    final String does;

    LiveKeys(int code, String key, String does) {
        this.code = code;
        this.key = key;
        this.does = does;
    }

    /** The key's action, or null for a key the window does not use. */
    static LiveKeys of(int code) {
        if (code == Codes.ESCAPE) return QUIT;
        for (LiveKeys key : values()) {
            if (key.code == code) return key;
        }
        return null;
    }

    /** One key a line, as --help and the h key print them. */
    static String table() {
        StringBuilder text = new StringBuilder();
        for (LiveKeys key : values()) text.append(String.format("  %-8s %s%n", key.key, key.does));
        return text.toString();
    }

    /** The short form for the window's title. */
    static String line() {
        return "a u c m o l r Space n p F5 q, h: keys";
    }
}
