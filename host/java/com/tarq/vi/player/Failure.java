package com.tarq.vi.player;

/** A failure a desktop host reports as it is, with status 1. */
final class Failure extends Exception {
    private static final long serialVersionUID = 1L;

    Failure(String message) {
        super(message);
    }
}
