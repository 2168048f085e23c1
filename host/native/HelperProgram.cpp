#include "HelperProgram.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <ctime>

int HelperProgram::run(const char* const arguments[], int keep, char* output, std::size_t capacity) {
    int pipe[2];
    if (pipe2(pipe, O_CLOEXEC) != 0) return -1;
    const pid_t child = _Fork();
    if (child == 0) {
        dup2(pipe[1], STDOUT_FILENO);
        const int nowhere = open("/dev/null", O_WRONLY);
        if (nowhere >= 0) dup2(nowhere, STDERR_FILENO);
        if (keep >= 0) fcntl(keep, F_SETFD, 0);
        execvp(arguments[0], const_cast<char* const*>(arguments));
        _exit(kNotFound);
    }
    close(pipe[1]);
    if (child < 0) {
        close(pipe[0]);
        return -1;
    }
    const int64_t deadline = monotonicMilliseconds() + kLimitMilliseconds;
    std::size_t size = output ? std::strlen(output) : 0;
    bool ended = false;
    while (!ended) {
        const int64_t left = deadline - monotonicMilliseconds();
        pollfd readable = {pipe[0], POLLIN, 0};
        if (left <= 0 || poll(&readable, 1, int(left)) == 0) break;
        char chunk[512];
        const ssize_t count = read(pipe[0], chunk, sizeof(chunk));
        if (count < 0 && errno == EINTR) continue;
        ended = count <= 0;
        for (ssize_t at = 0; output && at < count && size + 1 < capacity; ++at) output[size++] = chunk[at];
        if (output) output[size] = '\0';
    }
    close(pipe[0]);
    if (!ended) kill(child, SIGKILL);
    int status = 0;
    while (waitpid(child, &status, 0) < 0 && errno == EINTR) {}
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

int64_t HelperProgram::monotonicMilliseconds() {
    timespec now;
    clock_gettime(CLOCK_MONOTONIC, &now);
    return now.tv_sec * 1000 + now.tv_nsec / 1000000;
}
