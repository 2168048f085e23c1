package com.tarq.test;

import java.util.ArrayList;
import java.util.List;

/** The recording scene of the test plug-in: its configuration and what it saw. */
public final class TestScene {
    public static final int CREATED = 0;
    public static final int DESTROYED = 1;

    static {
        TestHost.load();
    }

    private TestScene() {}

    /** One call the scene received: its kind, the factory that made the scene and two int arguments. */
    public static final class Event {
        public final int kind, factory, a, b;

        Event(int[] i) {
            kind = i[0];
            factory = i[2];
            a = i[3];
            b = i[4];
        }
    }

    public static List<Event> eventsOf(int kind) {
        List<Event> events = new ArrayList<>();
        for (int i = 0, n = eventCount(); i < n; ++i) {
            Event event = new Event(eventInts(i));
            if (event.kind == kind) events.add(event);
        }
        return events;
    }

    /** Forgets everything and restores the defaults. */
    public static native void reset();
    public static native void setNames(String[] names);
    public static native void setDrawResult(int result);
    public static native void setClearColour(boolean enabled, float red, float green, float blue, float alpha);
    /** Puts the plug-in's second factory into the runtime's factory pointer. */
    public static native void useSecondFactory();
    public static native int eventCount();
    public static native int count(int kind);
    private static native int[] eventInts(int index);
}
