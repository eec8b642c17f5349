#include "PasswordInput.h"

#include <errno.h>
#include <signal.h>
#include <string.h>
#include <sys/random.h>
#include <termios.h>
#include <unistd.h>

#include <iostream>

namespace {

constexpr size_t kMaxLine = 4096;
constexpr char kPassword[] = "password";
constexpr int kSignals[] = {SIGINT, SIGTERM, SIGHUP, SIGQUIT};

bool Fail(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

struct termios visibleTerminal;

// Whoever is interrupted must not leave a terminal that shows nothing.
void RestoreAndDie(int signal) {
    (void)tcsetattr(STDIN_FILENO, TCSANOW, &visibleTerminal);
    (void)::signal(signal, SIG_DFL);
    (void)raise(signal);
}

// Hides what is typed for as long as it lives.
class HiddenTyping {
  public:
    HiddenTyping() {
        if (tcgetattr(STDIN_FILENO, &visibleTerminal) != 0) {
            return;
        }
        for (const int signal : kSignals) {
            (void)::signal(signal, RestoreAndDie);
        }
        struct termios hidden = visibleTerminal;
        hidden.c_lflag &= ~static_cast<tcflag_t>(ECHO);
        hidden.c_lflag |= ECHONL;
        works_ = tcsetattr(STDIN_FILENO, TCSAFLUSH, &hidden) == 0;
    }
    ~HiddenTyping() {
        if (works_) {
            (void)tcsetattr(STDIN_FILENO, TCSANOW, &visibleTerminal);
        }
        for (const int signal : kSignals) {
            (void)::signal(signal, SIG_DFL);
        }
    }
    HiddenTyping(const HiddenTyping&) = delete;
    HiddenTyping& operator=(const HiddenTyping&) = delete;
    bool Works() const {
        return works_;
    }

  private:
    bool works_ = false;
};

// Byte by byte: what follows the line is somebody else's.
bool ReadLine(const std::string& what, std::string* line, std::string* problem) {
    std::string text;
    for (char byte = 0; text.size() <= kMaxLine;) {
        const ssize_t got = read(STDIN_FILENO, &byte, 1);
        if (got < 0 && errno == EINTR) {
            continue;
        }
        if (got < 0) {
            return Fail(problem, "cannot read the " + what + ": " + strerror(errno));
        }
        if (got == 0 && text.empty()) {
            return Fail(problem, "no " + what + " was given");
        }
        if (got == 0 || byte == '\n') {
            *line = text;
            return true;
        }
        text += byte;
    }
    return Fail(problem, "the " + what + " is too long");
}

bool Ask(const char* question, const char* what, std::string* answer, std::string* problem) {
    const HiddenTyping hidden;
    if (!hidden.Works()) {
        return Fail(problem, "cannot hide what is typed");
    }
    std::cerr << question << std::flush;
    return ReadLine(what, answer, problem);
}

}  // namespace

bool ReadNewPassword(std::string* password, std::string* problem) {
    if (isatty(STDIN_FILENO) == 0) {
        return ReadLine(kPassword, password, problem);
    }
    std::string first;
    std::string second;
    if (!Ask("New password: ", kPassword, &first, problem) ||
        !Ask("Again: ", kPassword, &second, problem)) {
        return false;
    }
    if (first != second) {
        return Fail(problem, "the two passwords differ");
    }
    *password = first;
    return true;
}

bool ReadSecret(std::string* secret, std::string* problem) {
    constexpr char kSecret[] = "secret";
    return isatty(STDIN_FILENO) == 0 ? ReadLine(kSecret, secret, problem)
                                     : Ask("Secret: ", kSecret, secret, problem);
}

bool GeneratePassword(std::string* password, std::string* problem) {
    constexpr char kAlphabet[] = "abcdefghijkmnpqrstuvwxyzABCDEFGHJKLMNPQRSTUVWXYZ23456789";
    constexpr size_t kLetters = sizeof kAlphabet - 1;
    constexpr size_t kLength = 20;
    std::string made;
    while (made.size() < kLength) {
        unsigned char byte = 0;
        if (getrandom(&byte, 1, 0) != 1) {
            return Fail(problem, std::string("no random bytes: ") + strerror(errno));
        }
        // The rest of the range would make some letters likelier.
        if (byte < 256 / kLetters * kLetters) {
            made += kAlphabet[byte % kLetters];
        }
    }
    *password = made;
    return true;
}
