package com.tarq.test;

import java.util.ArrayList;
import java.util.List;

/** The recording scene of the test plug-in: its configuration and what it saw. */
public final class TestScene {
    public static final int CREATED = 0;
    public static final int DESTROYED = 1;
    public static final int CLEAR_EFFECT = 2;
    public static final int AFFORDANCE = 3;
    public static final int UNLOCK = 4;
    public static final int TEXTURE_UPDATED = 5;
    public static final int INIT_EFFECT = 6;
    public static final int INIT_EFFECT_ALTERNATE = 7;
    public static final int DRAW = 8;
    public static final int TOUCH_DOWN = 9;
    public static final int TOUCH_UP = 10;
    public static final int TOUCH_MOVE = 11;
    public static final int KEY_PRESSED = 12;
    public static final int PARAM = 13;

    static {
        TestHost.load();
    }

    private TestScene() {}

    /** One call the scene received, with the members it saw during the call. */
    public static final class Event {
        public final int kind, scene, factory, a, b, orientation;
        public final boolean initialised0, initialised1;
        public final float x, y, sizeX, sizeY, aspect, scaleX, scaleY, now;

        Event(int[] i, float[] f) {
            kind = i[0];
            scene = i[1];
            factory = i[2];
            a = i[3];
            b = i[4];
            orientation = i[5];
            initialised0 = i[6] != 0;
            initialised1 = i[7] != 0;
            x = f[0];
            y = f[1];
            sizeX = f[2];
            sizeY = f[3];
            aspect = f[4];
            scaleX = f[5];
            scaleY = f[6];
            now = f[7];
        }
    }

    public static List<Event> events() {
        List<Event> events = new ArrayList<>();
        for (int i = 0, n = eventCount(); i < n; ++i) events.add(new Event(eventInts(i), eventFloats(i)));
        return events;
    }

    public static List<Event> eventsOf(int kind) {
        List<Event> events = new ArrayList<>();
        for (Event event : events()) if (event.kind == kind) events.add(event);
        return events;
    }

    public static List<Integer> kinds() {
        List<Integer> kinds = new ArrayList<>();
        for (Event event : events()) kinds.add(event.kind);
        return kinds;
    }

    /** Forgets everything and restores the defaults. */
    public static native void reset();
    /** Forgets the events only. */
    public static native void clearEvents();
    public static native void setNames(String[] names);
    public static native void setDrawResult(int result);
    public static native void setInitialOrientation(int orientation);
    public static native void setClearColour(boolean enabled, float red, float green, float blue, float alpha);
    /** Puts the plug-in's second factory into the runtime's factory pointer. */
    public static native void useSecondFactory();
    public static native int eventCount();
    public static native int count(int kind);
    public static native int overlaps();
    private static native int[] eventInts(int index);
    private static native float[] eventFloats(int index);
}
