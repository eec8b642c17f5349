#ifndef PROGRAMS_WEBAPI_ACCOUNT_PASSWORDINPUT_H
#define PROGRAMS_WEBAPI_ACCOUNT_PASSWORDINPUT_H

#include <string>

// A new password, from the terminal twice and without echo, or as one line from
// a standard input that is no terminal. False with `problem` in words.
bool ReadNewPassword(std::string* password, std::string* problem);

// The secret that another appliance has made for this one: once without echo, or as
// one line from a standard input that is no terminal.
bool ReadSecret(std::string* secret, std::string* problem);

// 20 random letters and digits, some 116 bits, without those that look alike.
bool GeneratePassword(std::string* password, std::string* problem);

#endif
