#include "Arguments.h"

#include <getopt.h>

#include <fstream>
#include <iostream>
#include <iterator>
#include <memory>

namespace {

bool Fail(std::string* problem, const std::string& text) {
    *problem = text;
    return false;
}

bool ParseStrict(const std::string& text, Json::Value* out) {
    Json::CharReaderBuilder builder;
    Json::CharReaderBuilder::strictMode(&builder.settings_);
    builder["strictRoot"] = false;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value value;
    try {
        if (!reader->parse(text.data(), text.data() + text.size(), &value, nullptr)) {
            return false;
        }
    } catch (const Json::Exception&) {  // nested too deep
        return false;
    }
    *out = value;
    return true;
}

// "-" is standard input.
bool ReadObject(const std::string& path, Json::Value* out, std::string* problem) {
    std::string text;
    if (path == "-") {
        text.assign(std::istreambuf_iterator<char>(std::cin), {});
    } else {
        std::ifstream file(path);
        if (!file) {
            return Fail(problem, "cannot read " + path);
        }
        text.assign(std::istreambuf_iterator<char>(file), {});
    }
    Json::Value value;
    if (!ParseStrict(text, &value) || !value.isObject()) {
        return Fail(problem, path + " is not a JSON object");
    }
    *out = value;
    return true;
}

// "name=value": the value is JSON where it parses as JSON, else text.
bool AddParameter(const std::string& word, Arguments* arguments, std::string* problem) {
    const size_t equals = word.find('=');
    if (equals == std::string::npos || equals == 0) {
        return Fail(problem, "expected name=value, got \"" + word + "\"");
    }
    const std::string name = word.substr(0, equals);
    const std::string text = word.substr(equals + 1);
    Json::Value value;
    if (!ParseStrict(text, &value)) {
        value = text;
    }
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
                if (!ParseStrict(optarg, &arguments->attrs) || !arguments->attrs.isObject()) {
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
