// Usage: feed_in_pieces DELAY_MS PIECES COMMAND [ARG...]
// Runs COMMAND with its standard input on a pipe in non-blocking mode, writes each of the
// '|'-separated PIECES into the pipe DELAY_MS milliseconds after the one before, closes it, and
// exits as COMMAND did: a reader that takes a pipe with nothing in it yet (EAGAIN) for its end
// stops early.
#include <chrono>
#include <cstdlib>
#include <fcntl.h>
#include <sstream>
#include <string>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

int main(int argc, char** argv) {
    int ends[2];
    if (argc < 4 || ::pipe(ends) != 0) {
        return 125;
    }
    const pid_t child = ::fork();
    if (child == 0) {
        ::dup2(ends[0], STDIN_FILENO);
        ::close(ends[0]);
        ::close(ends[1]);
        ::fcntl(STDIN_FILENO, F_SETFL, ::fcntl(STDIN_FILENO, F_GETFL) | O_NONBLOCK);
        ::execvp(argv[3], argv + 3);
        std::_Exit(127);
    }
    ::close(ends[0]);
    const std::chrono::milliseconds delay(std::atoi(argv[1]));
    std::istringstream pieces(argv[2]);
    for (std::string piece; std::getline(pieces, piece, '|');) {
        std::this_thread::sleep_for(delay);
        if (::write(ends[1], piece.data(), piece.size()) != static_cast<ssize_t>(piece.size())) {
            return 125;
        }
    }
    ::close(ends[1]);
    int status = 0;
    ::waitpid(child, &status, 0);
    return WIFEXITED(status) ? WEXITSTATUS(status) : 128;
}
