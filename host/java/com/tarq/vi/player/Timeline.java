package com.tarq.vi.player;

import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.List;
import java.util.Locale;
import java.util.Map;

/**
 * Host events at times, one a line: "SECONDS EVENT ARGUMENTS", '#' starts a
 * comment. Times are seconds from the first frame and never go back. The
 * events are those a phone's host sends; host/README.md lists them.
 */
final class Timeline {
    /** One event: its time, its kind, its arguments as written, and where it was written. */
    record Event(double time, String kind, List<String> arguments, int line) {
        int integer(int index) {
            return Integer.parseInt(arguments.get(index));
        }
    }

    /** Each event kind with the argument forms it takes. */
    private static final Map<String, String[]> FORMS = Map.ofEntries(
        Map.entry("touch", new String[] {"down|move|up", "X", "Y"}),
        Map.entry("key", new String[] {"menu|up|down"}),
        Map.entry("keycode", new String[] {"CODE"}),
        Map.entry("orientation", new String[] {"0|1"}),
        Map.entry("param", new String[] {"A", "B"}),
        Map.entry("affordance", new String[] {}),
        Map.entry("unlock", new String[] {}),
        Map.entry("clear", new String[] {}),
        Map.entry("restart", new String[] {}),
        Map.entry("recycle", new String[] {}),
        Map.entry("lose-context", new String[] {}),
        Map.entry("image", new String[] {"NAME", "FILE"}),
        Map.entry("end", new String[] {}));

    private final List<Event> events;

    private Timeline(List<Event> events) {
        this.events = events;
    }

    static Timeline empty() {
        return new Timeline(List.of());
    }

    List<Event> events() {
        return events;
    }

    /** The time of the "end" event, or -1 when there is none. */
    double end() {
        for (Event event : events) {
            if (event.kind().equals("end")) return event.time();
        }
        return -1;
    }

    double lastTime() {
        return events.isEmpty() ? 0 : events.get(events.size() - 1).time();
    }

    static Timeline read(Path file) throws IOException, TimelineException {
        return parse(file.toString(), Files.readAllLines(file, StandardCharsets.UTF_8));
    }

    static Timeline parse(String source, List<String> lines) throws TimelineException {
        List<Event> events = new ArrayList<>();
        double previous = 0;
        boolean ended = false;
        for (int index = 0; index < lines.size(); ++index) {
            final int number = index + 1;
            String text = lines.get(index);
            int comment = text.indexOf('#');
            if (comment >= 0) text = text.substring(0, comment);
            text = text.strip();
            if (text.isEmpty()) continue;
            if (ended) throw new TimelineException(source, number, "an event after \"end\"");

            String[] words = text.split("\\s+");
            double time = parseTime(source, number, words[0]);
            if (time < previous) {
                throw new TimelineException(source, number, String.format(Locale.ROOT,
                    "time %s goes back (the line before is at %s)", words[0], format(previous)));
            }
            if (words.length < 2) throw new TimelineException(source, number, "a time without an event");
            String kind = words[1];
            String[] form = FORMS.get(kind);
            if (form == null) {
                throw new TimelineException(source, number, "unknown event \"" + kind + "\" (known: "
                    + String.join(", ", FORMS.keySet().stream().sorted().toList()) + ")");
            }
            List<String> arguments = List.of(words).subList(2, words.length);
            checkArguments(source, number, kind, form, arguments);
            events.add(new Event(time, kind, arguments, number));
            previous = time;
            ended = kind.equals("end");
        }
        return new Timeline(List.copyOf(events));
    }

    private static double parseTime(String source, int line, String word) throws TimelineException {
        try {
            double time = Double.parseDouble(word);
            if (Double.isFinite(time) && time >= 0 && !word.matches(".*[a-zA-Z].*")) return time;
        } catch (NumberFormatException e) {
            // reported below
        }
        throw new TimelineException(source, line, "\"" + word + "\" is not a time in seconds (0 or more)");
    }

    private static void checkArguments(String source, int line, String kind, String[] form, List<String> arguments)
            throws TimelineException {
        String usage = (kind + " " + String.join(" ", form)).strip();
        if (arguments.size() != form.length) {
            throw new TimelineException(source, line, "\"" + kind + "\" takes " + form.length
                + (form.length == 1 ? " argument" : " arguments") + ": " + usage);
        }
        for (int i = 0; i < form.length; ++i) {
            String argument = arguments.get(i);
            boolean valid;
            if (form[i].contains("|")) {
                valid = List.of(form[i].split("\\|")).contains(argument);
            } else if (form[i].equals("NAME") || form[i].equals("FILE")) {
                valid = true;
            } else {
                valid = argument.matches("-?\\d{1,9}");
            }
            if (!valid) {
                throw new TimelineException(source, line, "\"" + argument + "\" is not a valid " + form[i]
                    + " for \"" + kind + "\": " + usage);
            }
        }
        if (kind.equals("keycode") && Integer.parseInt(arguments.get(0)) == Session.BLOCKING_KEY) {
            throw new TimelineException(source, line, "key code " + Session.BLOCKING_KEY + " is refused: the runtime"
                + " handles it by taking its own lock a second time and would wait for ever (\"clear\" clears)");
        }
    }

    private static String format(double seconds) {
        return String.format(Locale.ROOT, "%.3f", seconds);
    }
}
