#include "Arguments.h"

#include <getopt.h>

#include <limits>

namespace {

enum Option {
    kAdmin = 1,
    kGenerate,
    kExpires,
    kNetwork,
    kNone,
    kJson,
    kUrl,
    kSelf,
    kAuthority,
    kPin,
    kAccept,
    kClass,
    kUser,
    kHelp
};

const struct option kOptions[] = {
    {"admin", no_argument, nullptr, kAdmin},
    {"generate", no_argument, nullptr, kGenerate},
    {"expires", required_argument, nullptr, kExpires},
    {"network", required_argument, nullptr, kNetwork},
    {"none", no_argument, nullptr, kNone},
    {"json", no_argument, nullptr, kJson},
    {"url", required_argument, nullptr, kUrl},
    {"self", required_argument, nullptr, kSelf},
    {"authority", required_argument, nullptr, kAuthority},
    {"pin", required_argument, nullptr, kPin},
    {"accept", no_argument, nullptr, kAccept},
    {"class", required_argument, nullptr, kClass},
    {"user", required_argument, nullptr, kUser},
    {"help", no_argument, nullptr, kHelp},
    {nullptr, 0, nullptr, 0},
};

constexpr size_t kAnyNumber = 1000;

enum class Subject { kNothing, kAccount, kNode };

struct CommandRow {
    const char* command;
    Subject subject;    // the first word
    size_t leastWords;  // behind it
    size_t mostWords;
    const char* options;
};

constexpr CommandRow kCommands[] = {
    {"add", Subject::kAccount, 0, 0, "admin generate"},
    {"passwd", Subject::kAccount, 0, 0, "generate expires"},
    {"remove", Subject::kAccount, 0, 0, ""},
    {"list", Subject::kNothing, 0, 0, "json"},
    {"lock", Subject::kAccount, 0, 0, ""},
    {"unlock", Subject::kAccount, 0, 0, ""},
    {"groups", Subject::kAccount, 0, kAnyNumber, "none"},
    {"grant", Subject::kAccount, 1, 1, "network"},
    {"revoke", Subject::kAccount, 1, 1, ""},
    {"rotate-key", Subject::kNothing, 0, 0, ""},
    {"node add", Subject::kNode, 0, 0, "url self authority pin accept class"},
    {"node list", Subject::kNothing, 0, 0, "json"},
    {"node remove", Subject::kNode, 0, 0, ""},
    {"node test", Subject::kNode, 0, 0, "user"},
};

bool Fail(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

bool ParseNumber(const char* text, long long most, long long* number) {
    long long value = 0;
    if (*text == '\0') {
        return false;
    }
    for (; *text != '\0'; ++text) {
        const int digit = *text - '0';
        if (digit < 0 || digit > 9 || value > (most - digit) / 10) {
            return false;
        }
        value = value * 10 + digit;
    }
    *number = value;
    return true;
}

bool ParseDays(const char* text, long long* days) {
    constexpr long long kMost = 36500;
    return ParseNumber(text, kMost, days);
}

bool ParseNode(const char* text, long long* node) {
    long long number = 0;
    if (!ParseNumber(text, std::numeric_limits<long long>::max(), &number) || number == 0) {
        return false;
    }
    *node = number;
    return true;
}

// What an option that takes a text has; it says nothing when it is empty.
bool TakeText(const char* option, std::string* text, std::string* problem) {
    *text = optarg;
    return !text->empty() || Fail(problem, std::string(option) + " takes a text");
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
        case kUrl:
            return TakeText("--url", &arguments->url, problem);
        case kSelf:
            return ParseNode(optarg, &arguments->self) ||
                   Fail(problem, "--self takes a number from 1 up");
        case kAuthority:
            return TakeText("--authority", &arguments->authority, problem);
        case kPin:
            return TakeText("--pin", &arguments->pin, problem);
        case kAccept:
            arguments->accept = true;
            return true;
        case kClass:
            arguments->classes.emplace_back();
            return TakeText("--class", &arguments->classes.back(), problem);
        case kUser:
            return TakeText("--user", &arguments->user, problem);
        default:
            arguments->help = true;
            return true;
    }
}

bool TakesOption(const CommandRow& row, const std::string& option) {
    return (" " + std::string(row.options) + " ").find(" " + option + " ") != std::string::npos;
}

bool TakeSubject(const CommandRow& row, Arguments* arguments, std::string* problem) {
    std::vector<std::string>& words = arguments->words;
    const bool isNode = row.subject == Subject::kNode;
    if (row.subject == Subject::kNothing) {
        return true;
    }
    if (words.empty()) {
        return Fail(problem,
                    isNode ? "the appliance's number is missing" : "the account's name is missing");
    }
    arguments->name = words.front();
    words.erase(words.begin());
    return !isNode || ParseNode(arguments->name.c_str(), &arguments->node) ||
           Fail(problem, "an appliance is a number from 1 up");
}

bool CheckNodeAdd(const Arguments& arguments, std::string* problem) {
    const bool called = !arguments.url.empty();
    if (called != (arguments.self != 0)) {
        return Fail(problem, "--url and --self go together");
    }
    if (!called && !(arguments.authority.empty() && arguments.pin.empty())) {
        return Fail(problem, "--authority and --pin go with --url");
    }
    if (!arguments.accept && !arguments.classes.empty()) {
        return Fail(problem, "--class goes with --accept");
    }
    return called || arguments.accept || Fail(problem, "--url or --accept is missing");
}

bool Check(const CommandRow& row, const std::vector<std::string>& given, Arguments* arguments,
           std::string* problem) {
    for (const std::string& option : given) {
        if (!TakesOption(row, option)) {
            return Fail(problem, "\"" + arguments->command + "\" takes no --" + option);
        }
    }
    if (!TakeSubject(row, arguments, problem)) {
        return false;
    }
    const std::vector<std::string>& words = arguments->words;
    if (words.size() < row.leastWords) {
        return Fail(problem, "the privilege is missing");
    }
    if (words.size() > row.mostWords) {
        return Fail(problem, "\"" + words[row.mostWords] + "\" is one word too many");
    }
    if (arguments->command == "node add" && !CheckNodeAdd(*arguments, problem)) {
        return false;
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
    if (arguments->command == "node" && !arguments->words.empty()) {
        arguments->command += " " + arguments->words.front();
        arguments->words.erase(arguments->words.begin());
    }
    for (const CommandRow& row : kCommands) {
        if (arguments->command == row.command) {
            return Check(row, given, arguments, problem);
        }
    }
    return Fail(problem, "unknown command \"" + arguments->command + "\"");
}
