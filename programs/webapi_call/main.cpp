#include <pwd.h>
#include <unistd.h>

#include <iostream>

#include "Arguments.h"
#include "webapi/APIRunner.h"

namespace {

enum ExitStatus { kSuccess = 0, kAPIError = 1, kWrongUsage = 2 };

const char kUsage[] =
    "usage: webapi-call API METHOD [NAME=VALUE ...] [OPTION ...]\n"
    "\n"
    "Runs one method in this process and prints its result document.\n"
    "A VALUE is JSON where it parses as JSON, else text; version=N is the\n"
    "version to call, 1 unless given.\n"
    "\n"
    "  --user NAME    act as this user (default: who runs the command)\n"
    "  --attrs JSON   attributes of the request, a JSON object\n"
    "  --params FILE  parameters from a JSON object in FILE, \"-\" for standard input\n"
    "  --compact      print one line\n"
    "  --help         print this\n"
    "\n"
    "Exit status: 0 success, 1 the method answered an error, 2 wrong usage.\n";

std::string OwnName() {
    const struct passwd* account = getpwuid(getuid());
    return account != nullptr ? account->pw_name : "";
}

void Print(const Json::Value& document, bool compact) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = compact ? "" : "  ";
    builder["emitUTF8"] = true;
    std::cout << Json::writeString(builder, document) << std::endl;
}

}  // namespace

int main(int argc, char** argv) {
    Arguments arguments;
    std::string problem;
    if (!ParseArguments(argc, argv, &arguments, &problem)) {
        std::cerr << "webapi-call: " << problem << "\n\n" << kUsage;
        return kWrongUsage;
    }
    if (arguments.help) {
        std::cout << kUsage;
        return kSuccess;
    }
    const std::string user = arguments.user.empty() ? OwnName() : arguments.user;
    Json::Value document;
    TALO::APIRunner::Exec(document, arguments.api.c_str(), arguments.version,
                          arguments.method.c_str(), arguments.params, arguments.attrs,
                          user.c_str());
    Print(document, arguments.compact);
    return document["success"].asBool() ? kSuccess : kAPIError;
}
