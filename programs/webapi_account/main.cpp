#include <time.h>

#include <iostream>

#include "Arguments.h"
#include "Listing.h"
#include "Nodes.h"
#include "PasswordInput.h"
#include "hosts/linux/sdk/Accounts.h"
#include "hosts/linux/sdk/Cipher.h"

namespace {

enum ExitStatus { kSuccess = 0, kFailure = 1, kWrongUsage = 2 };

const char kUsage[] =
    "usage: webapi-account COMMAND [NAME] [ARGUMENT ...] [OPTION ...]\n"
    "\n"
    "Manages who may log in to the web API, and which other appliances it knows.\n"
    "\n"
    "  add NAME                    make an account\n"
    "      --admin                 in the group \"administrators\"\n"
    "  passwd NAME                 set another password\n"
    "      --expires DAYS          that has to be changed after so many days; 0: at once\n"
    "  remove NAME                 remove an account\n"
    "  lock NAME, unlock NAME      refuse its logins, or accept them again\n"
    "  groups NAME [GROUP ...]     set its groups; without any, print them\n"
    "      --none                  take it out of all groups\n"
    "  grant NAME PRIVILEGE        let it use an application\n"
    "      --network NETWORK       only from there, such as 192.168.0.0/16; grant again\n"
    "                              to add a network\n"
    "  revoke NAME PRIVILEGE       take that away, from everywhere\n"
    "  list                        print all accounts\n"
    "      --json                  as a JSON array\n"
    "  rotate-key                  make another key for clients that encipher parameters;\n"
    "                              the one before counts for another day\n"
    "  --help                      print this\n"
    "\n"
    "Other appliances, each by a number of your choice (docs/relay.md):\n"
    "\n"
    "  node add ID                 say how to reach it, what it may do here, or both; what\n"
    "                              was said of the other stays\n"
    "      --url URL --self ID     call it there, where this appliance has that number; asks\n"
    "                              for the secret, which \"node add --accept\" printed there\n"
    "      --authority FILE        with a certificate of these authorities, not the system's\n"
    "      --pin PIN               with that public key: sha256//BASE64\n"
    "      --accept                let it act for users here; prints the secret for it, once\n"
    "      --class CLASS           only for users of a class, normal.local unless given; may\n"
    "                              be repeated\n"
    "  node list                   print all appliances, without secrets\n"
    "      --json                  as a JSON array\n"
    "  node remove ID              forget it; its sessions here count no more\n"
    "  node test ID                call it, as for the user of this process\n"
    "      --user NAME             as for that user\n"
    "\n"
    "add and passwd ask for the password on the terminal, or read it as one line from a\n"
    "standard input that is no terminal. With --generate they make one and print it.\n"
    "\n"
    "Exit status: 0 success, 1 it could not be done, 2 wrong usage.\n";

constexpr long long kSecondsPerDay = 24LL * 3600;

bool GetPassword(const Arguments& arguments, std::string* password, std::string* problem) {
    return arguments.generate ? GeneratePassword(password, problem)
                              : ReadNewPassword(password, problem);
}

// Printed last: a password that does not count is not shown.
bool ShowGenerated(const Arguments& arguments, const std::string& password) {
    if (arguments.generate) {
        std::cout << password << std::endl;
    }
    return true;
}

bool Add(const Arguments& arguments, std::string* problem) {
    std::string password;
    return GetPassword(arguments, &password, problem) &&
           talo::AddAccount(arguments.name, password, problem) &&
           (!arguments.admin || talo::SetGroups(arguments.name, {"administrators"}, problem)) &&
           ShowGenerated(arguments, password);
}

bool Passwd(const Arguments& arguments, std::string* problem) {
    std::string password;
    const long long expires =
        arguments.expiresInDays < 0 ? 0 : time(nullptr) + arguments.expiresInDays * kSecondsPerDay;
    return GetPassword(arguments, &password, problem) &&
           talo::SetPassword(arguments.name, password, expires, problem) &&
           ShowGenerated(arguments, password);
}

bool Groups(const Arguments& arguments, std::string* problem) {
    if (!arguments.words.empty() || arguments.none) {
        return talo::SetGroups(arguments.name, arguments.words, problem);
    }
    talo::Account account;
    if (!talo::FindAccount(arguments.name, &account)) {
        *problem = "there is no account \"" + arguments.name + "\"";
        return false;
    }
    for (const std::string& group : account.groups) {
        std::cout << group << "\n";
    }
    return true;
}

bool List(const Arguments& arguments, std::string* problem) {
    std::vector<talo::Account> accounts;
    if (!talo::ListAccounts(&accounts)) {
        *problem = "the accounts cannot be read; the system log says why";
        return false;
    }
    std::cout << (arguments.json ? ListingJson(accounts) : ListingTable(accounts));
    return true;
}

bool Run(const Arguments& arguments, std::string* problem) {
    const std::string& command = arguments.command;
    const std::string& name = arguments.name;
    if (command == "add") {
        return Add(arguments, problem);
    }
    if (command == "passwd") {
        return Passwd(arguments, problem);
    }
    if (command == "remove") {
        return talo::RemoveAccount(name, problem);
    }
    if (command == "lock" || command == "unlock") {
        return talo::SetLocked(name, command == "lock", problem);
    }
    if (command == "groups") {
        return Groups(arguments, problem);
    }
    if (command == "grant") {
        return talo::GrantPrivilege(name, arguments.words[0], arguments.network, problem);
    }
    if (command == "revoke") {
        return talo::RevokePrivilege(name, arguments.words[0], problem);
    }
    if (command == "rotate-key") {
        return talo::RotateCipherKey(problem);
    }
    if (arguments.command.rfind("node ", 0) == 0) {
        return RunNodeCommand(arguments, problem);
    }
    return List(arguments, problem);
}

}  // namespace

int main(int argc, char** argv) {
    Arguments arguments;
    std::string problem;
    if (!ParseArguments(argc, argv, &arguments, &problem)) {
        std::cerr << "webapi-account: " << problem << "\n\n" << kUsage;
        return kWrongUsage;
    }
    if (arguments.help) {
        std::cout << kUsage;
        return kSuccess;
    }
    if (!Run(arguments, &problem)) {
        std::cerr << "webapi-account: " << problem << "\n";
        return kFailure;
    }
    return std::cout.flush() ? kSuccess : kFailure;
}
