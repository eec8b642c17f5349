#ifndef PROGRAMS_WEBAPI_ACCOUNT_ARGUMENTS_H
#define PROGRAMS_WEBAPI_ACCOUNT_ARGUMENTS_H

#include <string>
#include <vector>

// The command line, understood. Each command takes only the options that are
// its own.
struct Arguments {
    std::string command;
    std::string name;
    std::vector<std::string> words;  // behind the name
    std::string network;
    long long node = 0;  // of a command about appliances, whose name begins with "node "
    std::string url;
    std::string authority;
    std::string pin;
    long long self = 0;
    std::vector<std::string> classes;
    std::string user;
    bool accept = false;
    long long expiresInDays = -1;  // -1 for never
    bool admin = false;
    bool generate = false;
    bool none = false;
    bool json = false;
    bool help = false;
};

// False for wrong usage; `problem` then says what is wrong.
bool ParseArguments(int argc, char** argv, Arguments* arguments, std::string* problem);

#endif
