#include "Arguments.h"

#include <getopt.h>

namespace {

enum Option { kAdmin = 1, kGenerate, kExpires, kNetwork, kNone, kJson, kHelp };

const struct option kOptions[] = {
    {"admin", no_argument, nullptr, kAdmin},
    {"generate", no_argument, nullptr, kGenerate},
    {"expires", required_argument, nullptr, kExpires},
    {"network", required_argument, nullptr, kNetwork},
    {"none", no_argument, nullptr, kNone},
    {"json", no_argument, nullptr, kJson},
    {"help", no_argument, nullptr, kHelp},
    {nullptr, 0, nullptr, 0},
};

constexpr size_t kAnyNumber = 1000;

struct CommandRow {
    const char* command;
    bool takesName;
    size_t leastWords;  // behind the name
    size_t mostWords;
    const char* options;
};

constexpr CommandRow kCommands[] = {
    {"add", true, 0, 0, "admin generate"},
    {"passwd", true, 0, 0, "generate expires"},
    {"remove", true, 0, 0, ""},
    {"list", false, 0, 0, "json"},
    {"lock", true, 0, 0, ""},
    {"unlock", true, 0, 0, ""},
    {"groups", true, 0, kAnyNumber, "none"},
    {"grant", true, 1, 1, "network"},
    {"revoke", true, 1, 1, ""},
    {"rotate-key", false, 0, 0, ""},
};

bool Fail(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

bool ParseDays(const char* text, long long* days) {
    constexpr long long kMost = 36500;
    long long value = 0;
    if (*text == '\0') {
        return false;
    }
    for (; *text != '\0'; ++text) {
        if (*text < '0' || *text > '9' || (value = value * 10 + (*text - '0')) > kMost) {
            return false;
        }
    }
    *days = value;
    return true;
}

bool Take(int option, Arguments* arguments, std::string* problem) {
    switch (option) {
        case kAdmin:
            arguments->admin = true;
            return true;
        case kGenerate:
            arguments->generate = true;
            return true;
        case kExpires:
            return ParseDays(optarg, &arguments->expiresInDays) ||
                   Fail(problem, "--expires takes a number of days");
        case kNetwork:
            arguments->network = optarg;
            return !arguments->network.empty() || Fail(problem, "--network takes a network");
        case kNone:
            arguments->none = true;
            return true;
        case kJson:
            arguments->json = true;
            return true;
        default:
            arguments->help = true;
            return true;
    }
}

bool TakesOption(const CommandRow& row, const std::string& option) {
    return (" " + std::string(row.options) + " ").find(" " + option + " ") != std::string::npos;
}

bool Check(const CommandRow& row, const std::vector<std::string>& given, Arguments* arguments,
           std::string* problem) {
    for (const std::string& option : given) {
        if (!TakesOption(row, option)) {
            return Fail(problem, "\"" + arguments->command + "\" takes no --" + option);
        }
    }
    std::vector<std::string>& words = arguments->words;
    if (row.takesName) {
        if (words.empty()) {
            return Fail(problem, "the account's name is missing");
        }
        arguments->name = words.front();
        words.erase(words.begin());
    }
    if (words.size() < row.leastWords) {
        return Fail(problem, "the privilege is missing");
    }
    if (words.size() > row.mostWords) {
        return Fail(problem, "\"" + words[row.mostWords] + "\" is one word too many");
    }
    return (!arguments->none || words.empty()) || Fail(problem, "--none takes no groups");
}

}  // namespace

bool ParseArguments(int argc, char** argv, Arguments* arguments, std::string* problem) {
    std::vector<std::string> given;
    opterr = 0;
    int index = -1;
    for (int option = 0; (option = getopt_long(argc, argv, "", kOptions, &index)) != -1;) {
        if (option == '?') {
            return Fail(problem, std::string("unknown or incomplete option ") +
                                     argv[optind > 1 ? optind - 1 : 0]);
        }
        if (!Take(option, arguments, problem)) {
            return false;
        }
        given.emplace_back(kOptions[index].name);
    }
    if (arguments->help) {
        return true;
    }
    if (optind == argc) {
        return Fail(problem, "the command is missing");
    }
    arguments->command = argv[optind];
    arguments->words.assign(argv + optind + 1, argv + argc);
    for (const CommandRow& row : kCommands) {
        if (arguments->command == row.command) {
            return Check(row, given, arguments, problem);
        }
    }
    return Fail(problem, "unknown command \"" + arguments->command + "\"");
}
