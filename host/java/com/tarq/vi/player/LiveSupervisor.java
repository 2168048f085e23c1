package com.tarq.vi.player;

import static java.nio.charset.StandardCharsets.UTF_8;

import java.io.BufferedReader;
import java.io.IOException;
import java.io.OutputStream;
import java.io.PrintStream;
import java.nio.file.Files;
import java.nio.file.Path;
import java.util.ArrayList;
import java.util.Comparator;
import java.util.List;
import java.util.Set;
import java.util.concurrent.TimeUnit;
import java.util.stream.Stream;

/**
 * The process vi-live starts as. It owns the command line, the terminal and a
 * private folder, and runs the window in a child process of the same command:
 * after an effect has ended its own process (the runtime's fatal exit, a
 * crash), neither the runtime's lock nor its state can be trusted, so only a
 * new process can go on. When that happens once the window has shown a frame,
 * the next window process opens at the same place, turned the same way with
 * the same images, says why in its title, and waits for the next build;
 * otherwise the child's status is the status. Standard input is relayed to the
 * child as typed, and its output and errors back line by line; the child takes
 * the end of its standard input for a lost supervisor and ends too. On SIGINT, SIGTERM or SIGHUP the child is ended and
 * the folder removed.
 */
final class LiveSupervisor {
    /** Set in a window process's environment: the folder it shares with its supervisor. */
    static final String FOLDER_VARIABLE = "VI_LIVE_FOLDER";
    /** The runtime's exits on an author's mistake, and the crash handler's 128 + SIGILL, SIGABRT, SIGBUS, SIGFPE, SIGSEGV. */
    private static final Set<Integer> EFFECT_ENDINGS = Set.of(88, 67, 71, 45, 132, 134, 135, 136, 139);
    private static final String ERROR = "vi-live: error: ";
    /** A status above this is 128 + the signal that ended the process. */
    private static final int SIGNALLED = 128;
    /** 128 + SIGHUP, SIGINT, SIGTERM: a child asked to end (a Ctrl-C reaches it too) is no surprise to report. */
    private static final Set<Integer> ASKED_TO_END = Set.of(129, 130, 143);
    /** How long a child has to end on SIGTERM before it is killed. */
    private static final long STOP_SECONDS = 3;

    private static final Object RELAY_LOCK = new Object();

    private final Path folder;
    private final List<String> command;
    private Process child;
    private boolean stopping;
    private volatile String lastError;

    private LiveSupervisor(Path folder, List<String> command) {
        this.folder = folder;
        this.command = command;
    }

    /** Runs window processes until one ends for good; its status. */
    static int run() throws IOException, Failure {
        // The whole command line, however long (the JDK's view of it may be cut short).
        String line = new String(Files.readAllBytes(Path.of("/proc/self/cmdline")), UTF_8);
        List<String> command = new ArrayList<>(List.of(line.split("\0")));
        if (command.size() < 2) throw new Failure("cannot read its own command line to start the window with");
        Path folder = Files.createTempDirectory("vi-live-" + ProcessHandle.current().pid() + "-");
        LiveSupervisor supervisor = new LiveSupervisor(folder, command);
        Runtime.getRuntime().addShutdownHook(new Thread(supervisor::stop, "vi-live stop"));
        try {
            return supervisor.supervise();
        } catch (InterruptedException e) {
            Thread.currentThread().interrupt();
            return 1;
        }
    }

    private int supervise() throws IOException, InterruptedException {
        Thread input = new Thread(this::relayInput, "vi-live input");
        input.setDaemon(true);
        for (;;) {
            Process process = start();
            if (process == null) return 1;
            if (input.getState() == Thread.State.NEW) input.start();
            Thread output = new Thread(() -> relay(process.inputReader(UTF_8), System.out), "vi-live output");
            Thread errors = new Thread(() -> relay(process.errorReader(UTF_8), System.err), "vi-live errors");
            output.start();
            errors.start();
            int status = process.waitFor();
            output.join();
            errors.join();
            // Under the lock: once stopping, the folder is the shutdown hook's to remove.
            synchronized (this) {
                if (stopping) return status;
                LiveState state = LiveState.read(folder);
                boolean effectEnded = EFFECT_ENDINGS.contains(status) && state != null
                    && state.effectPid == process.pid();
                // A build that ends the process before the window has shown anything is not
                // waited out: the author sees the message and the status, as without a window.
                if (!effectEnded || !state.shown) {
                    if (status > SIGNALLED && !ASKED_TO_END.contains(status) && lastError == null) {
                        System.err.println(ERROR + "the window's process was ended by signal " + (status - SIGNALLED));
                    }
                    return status;
                }
                state.ended = lastError != null ? lastError : "the effect ended its process with status " + status;
                state.effectPid = 0;
                lastError = null;
                state.write(folder);
            }
        }
    }

    /** The next window process, or null once stopping. */
    private synchronized Process start() throws IOException {
        if (stopping) return null;
        ProcessBuilder builder = new ProcessBuilder(command);
        builder.environment().put(FOLDER_VARIABLE, folder.toString());
        child = builder.start();
        return child;
    }

    /** Standard input to whichever window process runs; what is typed while one replaces another is lost. */
    private void relayInput() {
        byte[] buffer = new byte[4096];
        try {
            for (int count = System.in.read(buffer); count > 0; count = System.in.read(buffer)) {
                OutputStream to;
                synchronized (this) {
                    to = child.getOutputStream();
                }
                try {
                    to.write(buffer, 0, count);
                    to.flush();
                } catch (IOException e) {
                    // That process has ended; the next one starts without it.
                }
            }
        } catch (IOException e) {
            // No console: the window's keys still work.
        }
        // The child's standard input stays open: its end would tell the child this process is gone.
    }

    /**
     * The child's standard output or error, a whole line at a time, so that
     * the two never cut into each other's lines; the last error's words are
     * kept for the next window's title.
     */
    private void relay(BufferedReader from, PrintStream to) {
        try (from) {
            for (String line = from.readLine(); line != null; line = from.readLine()) {
                if (to == System.err && line.startsWith(ERROR)) lastError = line.substring(ERROR.length());
                synchronized (RELAY_LOCK) {
                    to.println(line);
                    to.flush();
                }
            }
        } catch (IOException e) {
            // The child has gone; what it said is said.
        }
    }

    /** On every exit of this process: the window process ended (on SIGTERM, then SIGKILL), the folder removed. */
    private void stop() {
        Process process;
        synchronized (this) {
            stopping = true;
            process = child;
        }
        try {
            if (process != null && process.isAlive()) {
                process.destroy();
                if (!process.waitFor(STOP_SECONDS, TimeUnit.SECONDS)) process.destroyForcibly().waitFor();
            }
        } catch (InterruptedException e) {
            Thread.currentThread().interrupt();
        }
        removeFolder(folder);
    }

    /** Removes a folder and everything in it; what cannot be removed is left, said on standard error. */
    static void removeFolder(Path folder) {
        try (Stream<Path> paths = Files.walk(folder)) {
            for (Path path : paths.sorted(Comparator.reverseOrder()).toList()) Files.deleteIfExists(path);
        } catch (IOException e) {
            if (Files.exists(folder)) System.err.println("vi-live: cannot remove " + folder + ": " + e.getMessage());
        }
    }
}
