package com.tarq.vi.player;

import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertThrows;

import java.util.List;
import org.junit.jupiter.api.Test;
import org.junit.jupiter.params.ParameterizedTest;
import org.junit.jupiter.params.provider.CsvSource;

class TimelineTest {
    @Test
    void readsEventsWithTheirTimesArgumentsAndLinesSkippingCommentsAndBlanks() throws TimelineException {
        Timeline timeline = Timeline.parse("t", List.of(
            "# a comment",
            "",
            "0.5 touch down 10 20   # trailing comment",
            "0.5 key menu",
            "2 param -3 40",
            "3.25 end"));
        List<Timeline.Event> events = timeline.events();
        assertEquals(4, events.size());
        assertEquals(new Timeline.Event(0.5, "touch", List.of("down", "10", "20"), 3), events.get(0));
        assertEquals(-3, events.get(2).integer(0));
        assertEquals(6, events.get(3).line());
        assertEquals(3.25, timeline.end());
        assertEquals(-1, Timeline.parse("t", List.of("1 unlock")).end());
    }

    @ParameterizedTest
    @CsvSource(delimiter = '|', value = {
        "1 touch down 10 20|2 wiggle|t:2: unknown event \"wiggle\"",
        "soon unlock|1 unlock|t:1: \"soon\" is not a time in seconds",
        "-1 unlock|1 unlock|t:1: \"-1\" is not a time in seconds",
        "NaN unlock|1 unlock|t:1: \"NaN\" is not a time in seconds",
        "2 unlock|1 clear|t:2: time 1 goes back (the line before is at 2.000)",
        "1 touch down 10|2 clear|t:1: \"touch\" takes 3 arguments: touch down|move|up X Y",
        "1 touch press 1 2|2 clear|t:1: \"press\" is not a valid down|move|up for \"touch\"",
        "1 key home|2 clear|t:1: \"home\" is not a valid menu|up|down for \"key\"",
        "1 orientation 2|2 clear|t:1: \"2\" is not a valid 0|1 for \"orientation\"",
        "1 param 1 x|2 clear|t:1: \"x\" is not a valid B for \"param\"",
        "1 unlock now|2 clear|t:1: \"unlock\" takes 0 arguments: unlock",
        "1 image wallpaper|2 clear|t:1: \"image\" takes 2 arguments: image NAME FILE",
        "1 end|2 clear|t:2: an event after \"end\"",
        "1|2 clear|t:1: a time without an event"})
    void aLineItCannotReadIsNamedWithItsProblem(String first, String second, String message) {
        TimelineException error = assertThrows(TimelineException.class,
            () -> Timeline.parse("t", List.of(first, second)));
        assertEquals(true, error.getMessage().startsWith(message), error.getMessage());
    }
}
