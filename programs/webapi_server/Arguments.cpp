#include "programs/webapi_server/Arguments.h"

#include <getopt.h>
#include <string.h>
#include <unistd.h>

#include <charconv>
#include <cstdlib>

const char kUsage[] =
    "usage: webapi-server [OPTION ...]\n"
    "\n"
    "Serves the web API over SCGI, with workers that stand ready.\n"
    "\n"
    "  --socket PATH        listen on this UNIX socket (default: the one that systemd\n"
    "                       hands over)\n"
    "  --min-workers N      workers that there always are (2)\n"
    "  --max-workers N      workers that there are at most (32)\n"
    "  --queue N            requests that may wait for a worker (512)\n"
    "  --deadline SECONDS   for a request whose API has no limit of its own (90);\n"
    "                       0: no limit\n"
    "  --worker-requests N  requests that a worker serves before a new one takes its\n"
    "                       place (10000)\n"
    "  --worker-growth KIB  of private memory, before the same (16384)\n"
    "  --worker-seconds N   of age, before the same (3600)\n"
    "  --help               print this\n"
    "\n"
    "SIGHUP loads descriptions and libraries anew, SIGTERM ends after the requests\n"
    "that are under way.\n"
    "\n"
    "Exit status: 0 ended by a signal, 1 cannot work, 2 wrong usage.\n";

namespace {

struct Limit {
    const char* option;
    int Settings::*member;
    int least;
    int most;
};

constexpr int kDay = 24 * 60 * 60;

const Limit kLimits[] = {
    {"min-workers", &Settings::minWorkers, 1, 1024},
    {"max-workers", &Settings::maxWorkers, 1, 1024},
    {"queue", &Settings::queue, 1, 65536},
    {"deadline", &Settings::deadlineSeconds, 0, kDay},
    {"worker-requests", &Settings::workerRequests, 1, 1000000000},
    {"worker-growth", &Settings::workerGrowthKiB, 1, 1 << 24},
    {"worker-seconds", &Settings::workerSeconds, 1, 365 * kDay},
};

constexpr int kHelp = 'h';
constexpr int kSocket = 's';
constexpr int kFirstLimit = 256;

bool Fail(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

bool ParseNumber(const char* text, long long* number) {
    const char* const end = text + strlen(text);
    const auto parsed = std::from_chars(text, end, *number);
    return parsed.ec == std::errc() && parsed.ptr == end && end != text;
}

bool ReadLimit(const Limit& limit, const char* text, Settings* settings, std::string* problem) {
    long long number = 0;
    if (!ParseNumber(text, &number) || number < limit.least || number > limit.most) {
        return Fail(problem, std::string("--") + limit.option + " takes a number from " +
                                 std::to_string(limit.least) + " to " + std::to_string(limit.most) +
                                 ", not \"" + text + "\"");
    }
    settings->*limit.member = static_cast<int>(number);
    return true;
}

bool ParseOptions(int argc, char** argv, Arguments* arguments, std::string* problem) {
    constexpr size_t kLimitCount = sizeof kLimits / sizeof kLimits[0];
    struct option options[kLimitCount + 3] = {
        {"help", no_argument, nullptr, kHelp},
        {"socket", required_argument, nullptr, kSocket},
    };
    for (size_t index = 0; index < kLimitCount; ++index) {
        options[index + 2] = {kLimits[index].option, required_argument, nullptr,
                              kFirstLimit + static_cast<int>(index)};
    }
    opterr = 0;
    optind = 0;  // from the start, however often
    for (int option = 0; (option = getopt_long(argc, argv, "", options, nullptr)) != -1;) {
        if (option == kHelp) {
            arguments->help = true;
        } else if (option == kSocket) {
            arguments->settings.socket = optarg;
            if (arguments->settings.socket.empty()) {
                return Fail(problem, "--socket takes a path");
            }
        } else if (option >= kFirstLimit) {
            if (!ReadLimit(kLimits[option - kFirstLimit], optarg, &arguments->settings, problem)) {
                return false;
            }
        } else {
            return Fail(problem, std::string("unknown or incomplete option ") +
                                     argv[optind > 1 ? optind - 1 : 0]);
        }
    }
    return true;
}

}  // namespace

bool ParseArguments(int argc, char** argv, Arguments* arguments, std::string* problem) {
    Arguments parsed;
    if (!ParseOptions(argc, argv, &parsed, problem)) {
        return false;
    }
    if (!parsed.help && optind < argc) {
        return Fail(problem, std::string("unexpected argument ") + argv[optind]);
    }
    if (parsed.settings.minWorkers > parsed.settings.maxWorkers) {
        return Fail(problem, "--min-workers is above --max-workers");
    }
    *arguments = parsed;
    return true;
}

HandedOver ReadHandedOver(std::string* problem) {
    const char* const process = getenv("LISTEN_PID");
    const char* const count = getenv("LISTEN_FDS");
    long long number = 0;
    const bool isOurs = process != nullptr && count != nullptr && ParseNumber(process, &number) &&
                        number == getpid();
    const bool isOne = isOurs && ParseNumber(count, &number) && number == 1;
    for (const char* name : {"LISTEN_PID", "LISTEN_FDS", "LISTEN_FDNAMES"}) {
        (void)unsetenv(name);
    }
    if (!isOurs) {
        return HandedOver::kNothing;
    }
    if (!isOne) {
        *problem = "systemd is to hand over one socket";
        return HandedOver::kUnusable;
    }
    return HandedOver::kSocket;
}
