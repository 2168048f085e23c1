package com.tarq.vi.player;

/** A timeline line the player cannot read: the message names the file and line. */
final class TimelineException extends Exception {
    private static final long serialVersionUID = 1L;

    TimelineException(String source, int line, String problem) {
        super(source + ":" + line + ": " + problem);
    }
}
