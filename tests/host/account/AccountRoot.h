#ifndef TESTS_HOST_ACCOUNT_ACCOUNTROOT_H
#define TESTS_HOST_ACCOUNT_ACCOUNTROOT_H

#include <gtest/gtest.h>

#include <string>
#include <vector>

// A root with nothing in it but the password module. Gone at the end.
class AccountRoot : public ::testing::Test {
  public:
    void SetUp() override;
    void TearDown() override;

    static void WriteAccounts(const std::string& content);
    static std::string ReadAccounts();
    static void Configure(const std::string& line);  // a line of host.conf

    // A line with the given members besides name and uid: `"locked":true`.
    static std::string Line(const std::string& name, unsigned uid, const std::string& more = "");
};

// What went to the system log since the test began.
const std::vector<std::string>& Logged();
bool WasLogged(const std::string& part);

std::string ReadFile(const std::string& path);
void WriteFile(const std::string& path, const std::string& content);

#endif
