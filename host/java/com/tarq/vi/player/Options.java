package com.tarq.vi.player;

import java.nio.file.Path;
import java.util.LinkedHashMap;
import java.util.List;
import java.util.Map;
import java.util.Set;

/** The player's command line. */
final class Options {
    static final String USAGE = String.join("\n",
        "usage: vi-player [options] PLUGIN.so",
        "Plays an effect plug-in headless through the runtime's JNI host interface and",
        "writes its frames, a contact sheet and an animated preview into a folder.",
        "",
        "  --timeline FILE      host events to play (format in host/README.md)",
        "  --image NAME=FILE    hand the runtime FILE (PNG or JPEG) under NAME; repeatable",
        "  --assets DIR         the plug-in's asset directory (default: assets/ beside the plug-in)",
        "  --size WxH           surface size in pixels (default 540x960)",
        "  --fps N              frames per second (default 30)",
        "  --duration SECONDS   length of the render (default: the timeline's end event,",
        "                       else its last event + 1 s, else 5 s)",
        "  --fixed-step         every frame advances the runtime's clock by exactly 1/fps:",
        "                       renders repeat bit for bit (default: real time, paced)",
        "  --out DIR            output folder (default out); replaced only if the player wrote it",
        "  --sheet N            frames on the contact sheet (default 8)",
        "  --compare DIR        compare each frame with the picture of its name in DIR; a frame",
        "                       that differs gets a diff picture (diff-NNNNN.png) beside it,",
        "                       and the run ends with status 1. Implies --fixed-step",
        "  --tolerance N        with --compare: a channel may differ by up to N (0-255, default 8)",
        "  --allow-pixels N     with --compare: pixels a frame may have beyond the tolerance",
        "                       (default 0)",
        "  --update             with --compare: make this render's frames the references in DIR",
        "  --quiet              no progress",
        "  --help               this text");

    /** The largest surface side. */
    private static final int MAX_SIDE = 8192;

    Path plugin;
    Path timeline;
    final Map<String, Path> images = new LinkedHashMap<>();
    Path assets;
    int width = 540;
    int height = 960;
    int fps = 30;
    double duration = -1;
    boolean fixedStep;
    Path out = Path.of("out");
    int sheetFrames = 8;
    boolean quiet;
    boolean help;
    Path compare;
    int tolerance = 8;
    int allowedPixels;
    boolean update;

    /** Thrown for a command line the player cannot use; the message says why. */
    static final class UsageException extends Exception {
        private static final long serialVersionUID = 1L;

        UsageException(String message) {
            super(message);
        }
    }

    static Options parse(String[] args) throws UsageException {
        return parse(args, null);
    }

    /** Parses only the options in `accepted` (all when null); any other is unknown. */
    static Options parse(String[] args, Set<String> accepted) throws UsageException {
        Options options = new Options();
        String comparing = null;  // the first option that needs --compare
        for (int i = 0; i < args.length; ++i) {
            String arg = args[i];
            if (!arg.startsWith("--")) {
                if (options.plugin != null) throw new UsageException("more than one plug-in given: " + arg);
                options.plugin = Path.of(arg);
                continue;
            }
            if (accepted != null && !accepted.contains(arg)) throw new UsageException("unknown option " + arg);
            switch (arg) {
                case "--help" -> {
                    options.help = true;
                    return options;
                }
                case "--fixed-step" -> options.fixedStep = true;
                case "--quiet" -> options.quiet = true;
                case "--timeline" -> options.timeline = Path.of(value(args, ++i, arg));
                case "--assets" -> options.assets = Path.of(value(args, ++i, arg));
                case "--out" -> options.out = Path.of(value(args, ++i, arg));
                case "--image" -> {
                    String mapping = value(args, ++i, arg);
                    int equals = mapping.indexOf('=');
                    if (equals <= 0 || equals == mapping.length() - 1) {
                        throw new UsageException("--image takes NAME=FILE, not \"" + mapping + "\"");
                    }
                    options.images.put(mapping.substring(0, equals), Path.of(mapping.substring(equals + 1)));
                }
                case "--size" -> {
                    String size = value(args, ++i, arg);
                    String[] parts = size.split("x");
                    if (parts.length != 2) throw new UsageException("--size takes WxH, not \"" + size + "\"");
                    options.width = whole(parts[0], "--size width", 1, MAX_SIDE);
                    options.height = whole(parts[1], "--size height", 1, MAX_SIDE);
                }
                case "--fps" -> options.fps = whole(value(args, ++i, arg), "--fps", 1, 240);
                case "--sheet" -> options.sheetFrames = whole(value(args, ++i, arg), "--sheet", 1, 64);
                case "--compare" -> options.compare = Path.of(value(args, ++i, arg));
                case "--tolerance" -> options.tolerance = whole(value(args, ++i, arg), arg, 0, 255);
                case "--allow-pixels" -> options.allowedPixels = whole(value(args, ++i, arg), arg, 0, MAX_SIDE * MAX_SIDE);
                case "--update" -> options.update = true;
                case "--duration" -> {
                    String text = value(args, ++i, arg);
                    try {
                        options.duration = Double.parseDouble(text);
                    } catch (NumberFormatException e) {
                        options.duration = -1;
                    }
                    if (!(options.duration > 0 && options.duration <= 3600)) {
                        throw new UsageException("--duration takes seconds above 0 (at most 3600), not \"" + text + "\"");
                    }
                }
                default -> throw new UsageException("unknown option " + arg);
            }
            if (comparing == null && List.of("--tolerance", "--allow-pixels", "--update").contains(arg)) comparing = arg;
        }
        if (options.plugin == null) throw new UsageException("no plug-in given");
        if (options.compare == null && comparing != null) throw new UsageException(comparing + " goes with --compare DIR");
        // A comparison needs the same frames on every run.
        if (options.compare != null) options.fixedStep = true;
        return options;
    }

    private static String value(String[] args, int index, String option) throws UsageException {
        if (index >= args.length) throw new UsageException(option + " needs a value");
        return args[index];
    }

    private static int whole(String text, String what, int from, int to) throws UsageException {
        try {
            int value = Integer.parseInt(text);
            if (value >= from && value <= to) return value;
        } catch (NumberFormatException e) {
            // reported below
        }
        throw new UsageException(what + " takes a whole number from " + from + " to " + to + ", not \"" + text + "\"");
    }
}
