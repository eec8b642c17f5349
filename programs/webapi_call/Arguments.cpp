#include "Arguments.h"

#include <getopt.h>

#include <cstdio>

#include "platform/WebAPIUtil.h"

namespace {

bool Fail(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

// A value by the rules of a web request's parameters: JSON where it is JSON, else text.
Json::Value ParseValue(const std::string& text) {
    Json::Value pair(Json::objectValue);
    (void)TALO::WebAPIUtil::strPairToJsonObj("value=" + TALO::WebAPIUtil::URLEncode(text), pair,
                                             true, true);
    return pair["value"];
}

bool ParseObject(const std::string& text, Json::Value* out) {
    const Json::Value value = ParseValue(text);
    if (!value.isObject()) {
        return false;
    }
    *out = value;
    return true;
}

bool ReadAll(FILE* file, std::string* text) {
    char block[4096];
    size_t got = 0;
    while ((got = fread(block, 1, sizeof block, file)) > 0) {
        text->append(block, got);
    }
    return ferror(file) == 0;
}

// "-" is standard input.
bool ReadObject(const std::string& path, Json::Value* out, std::string* problem) {
    FILE* file = path == "-" ? stdin : fopen(path.c_str(), "re");
    std::string text;
    const bool complete = file != nullptr && ReadAll(file, &text);
    if (file != nullptr && file != stdin) {
        (void)fclose(file);
    }
    if (!complete) {
        return Fail(problem, "cannot read " + path);
    }
    return ParseObject(text, out) || Fail(problem, path + " is not a JSON object");
}

// "name=value": the value is JSON where it parses as JSON, else text.
bool AddParameter(const std::string& word, Arguments* arguments, std::string* problem) {
    const size_t equals = word.find('=');
    if (equals == std::string::npos || equals == 0) {
        return Fail(problem, "expected name=value, got \"" + word + "\"");
    }
    const std::string name = word.substr(0, equals);
    const Json::Value value = ParseValue(word.substr(equals + 1));
    if (name != "version") {
        arguments->params[name] = value;
        return true;
    }
    if (!value.isInt()) {
        return Fail(problem, "version is no integer");
    }
    arguments->version = value.asInt();
    return true;
}

bool ParseOptions(int argc, char** argv, Arguments* arguments, std::string* problem) {
    static const struct option options[] = {
        {"user", required_argument, nullptr, 'u'},   {"attrs", required_argument, nullptr, 'a'},
        {"params", required_argument, nullptr, 'p'}, {"compact", no_argument, nullptr, 'c'},
        {"help", no_argument, nullptr, 'h'},         {nullptr, 0, nullptr, 0},
    };
    opterr = 0;
    for (int option = 0; (option = getopt_long(argc, argv, "", options, nullptr)) != -1;) {
        switch (option) {
            case 'u':
                arguments->user = optarg;
                break;
            case 'a':
                if (!ParseObject(optarg, &arguments->attrs)) {
                    return Fail(problem, "--attrs is not a JSON object");
                }
                break;
            case 'p':
                if (!ReadObject(optarg, &arguments->params, problem)) {
                    return false;
                }
                break;
            case 'c':
                arguments->compact = true;
                break;
            case 'h':
                arguments->help = true;
                break;
            default:
                return Fail(problem, std::string("unknown or incomplete option ") +
                                         argv[optind > 1 ? optind - 1 : 0]);
        }
    }
    return true;
}

}  // namespace

bool ParseArguments(int argc, char** argv, Arguments* arguments, std::string* problem) {
    if (!ParseOptions(argc, argv, arguments, problem)) {
        return false;
    }
    if (arguments->help) {
        return true;
    }
    if (argc - optind < 2) {
        return Fail(problem, "API and method are missing");
    }
    arguments->api = argv[optind];
    arguments->method = argv[optind + 1];
    for (int word = optind + 2; word < argc; ++word) {
        if (!AddParameter(argv[word], arguments, problem)) {
            return false;
        }
    }
    return true;
}
