#ifndef PROGRAMS_WEBAPI_CALL_ARGUMENTS_H
#define PROGRAMS_WEBAPI_CALL_ARGUMENTS_H

#include <json/json.h>

#include <string>

// The command line, understood.
struct Arguments {
    std::string api;
    std::string method;
    int version = 1;
    std::string user;
    Json::Value params = Json::Value(Json::objectValue);
    Json::Value attrs;
    bool compact = false;
    bool help = false;
};

// Reads the command line. False for wrong usage; `problem` then says what is wrong.
bool ParseArguments(int argc, char** argv, Arguments* arguments, std::string* problem);

#endif
