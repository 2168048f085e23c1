package com.tarq.vi.player;

import java.util.Collection;
import java.util.HashSet;
import java.util.List;
import java.util.Map;
import java.util.Set;

/**
 * Names an author most likely misspelt, warned about with the nearest real
 * name: an image handed in that the effect never asks for, an image it asks
 * for that none is handed in for, and a name it binds that its program does
 * not have. The runtime says nothing of them, as the phone needs: the picture
 * is just wrong. Each is warned about once; warnings are never quiet.
 */
final class Misspellings {
    private static String program = "vi-player";
    private static final Set<String> warnedImages = new HashSet<>();

    private Misspellings() {}

    /** From now on warnings start with the program's name, and bindings are told too. */
    static void watch(String program) {
        Misspellings.program = program;
        Desktop.tellUnboundNames();
    }

    /** The image names warned about so far. */
    static Set<String> warnedImages() {
        return Set.copyOf(warnedImages);
    }

    /** Image names warned about already, by the process before: not warned about again. */
    static void warnedBefore(Collection<String> names) {
        warnedImages.addAll(names);
    }

    /**
     * The images the effect asks for against those handed in (each name with
     * where it was given: "--image NAME" or "FILE:LINE" of a timeline).
     */
    static void images(List<String> asked, Map<String, String> given) {
        for (Map.Entry<String, String> image : given.entrySet()) {
            String name = image.getKey();
            if (asked.contains(name) || !warnedImages.add(name)) continue;
            warn("the image '" + name + "' is handed in but the effect never asks for it" + didYouMean(name, asked),
                "given by " + image.getValue(),
                asked.isEmpty() ? "the effect asks for no images" : "the effect asks for: " + String.join(", ", asked));
        }
        for (String name : asked) {
            if (given.containsKey(name) || !warnedImages.add(name)) continue;
            warn("the effect asks for the image '" + name + "' but none is handed in"
                + didYouMean(name, given.keySet()), "hand it in with --image " + name + "=FILE");
        }
    }

    /**
     * Called by the host's native listener for a name an effect's renderer
     * bound that the program does not have. `place` is "  in FUNCTION at
     * FILE:LINE" and a line end, or empty; `active` the program's names of the kind.
     */
    static void unbound(String kind, String name, String place, String[] active) {
        String near = nearest(name, List.of(active));
        System.err.print(program + ": warning: the " + kind + " '" + name + "' is not an active " + kind
            + " of its program, so nothing is bound to it" + (near == null ? "" : "; did you mean '" + near + "'?")
            + "\n" + place);
        System.err.println(active.length == 0 ? "  the program has no active " + kind + "s"
            : "  the program's active " + kind + "s: " + String.join(", ", active));
        if (near == null) {
            System.err.println("  a name the shaders declare but never use is not active: the compiler removes it");
        }
    }

    private static void warn(String what, String... details) {
        StringBuilder text = new StringBuilder(program + ": warning: " + what + "\n");
        for (String detail : details) text.append("  ").append(detail).append('\n');
        System.err.print(text);
    }

    private static String didYouMean(String name, Collection<String> candidates) {
        String near = nearest(name, candidates);
        return near == null ? "" : "; did you mean '" + near + "'?";
    }

    /** The candidate fewest edits away, when it is near enough to be a slip of the keys; else null. */
    static String nearest(String name, Collection<String> candidates) {
        String best = null;
        int bestDistance = Math.max(1, name.length() / 3) + 1;
        for (String candidate : candidates) {
            int distance = distance(name, candidate);
            if (distance < bestDistance) {
                best = candidate;
                bestDistance = distance;
            }
        }
        return best;
    }

    /** Edits (insert, delete, replace one character) that turn a into b. */
    private static int distance(String a, String b) {
        int[] row = new int[b.length() + 1];
        for (int j = 0; j <= b.length(); ++j) row[j] = j;
        for (int i = 1; i <= a.length(); ++i) {
            int diagonal = row[0];
            row[0] = i;
            for (int j = 1; j <= b.length(); ++j) {
                int above = row[j];
                row[j] = Math.min(Math.min(row[j] + 1, row[j - 1] + 1),
                    diagonal + (a.charAt(i - 1) == b.charAt(j - 1) ? 0 : 1));
                diagonal = above;
            }
        }
        return row[b.length()];
    }
}
