#include "programs/webapi_server/Environment.h"

#include <gtest/gtest.h>
#include <malloc.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <string>
#include <vector>

#include "tests/support/Child.h"

namespace {

// Variables of a process's own, in a child: gtest needs its environment.
void InProcessWith(std::vector<std::string> started, const std::function<void()>& body) {
    EXPECT_EQ(0, support::InChild([&] {
                     std::vector<char*> entries;
                     for (std::string& variable : started) {
                         entries.push_back(variable.data());
                     }
                     entries.push_back(nullptr);
                     environ = entries.data();
                     body();
                     return 0;
                 }).status);
}

std::vector<std::string> Shown() {
    std::vector<std::string> shown;
    for (char** entry = environ; *entry != nullptr; ++entry) {
        shown.emplace_back(*entry);
    }
    std::sort(shown.begin(), shown.end());
    return shown;
}

using Strings = std::vector<std::string>;

const char kInterface[] = "GATEWAY_INTERFACE=CGI/1.1";

}  // namespace

TEST(Environment, ShowsTheServersVariablesAndTheRequests) {
    InProcessWith({"PATH=/bin", "LANG=C"}, [] {
        Environment environment;
        environment.Enter({"QUERY_STRING=a=b", "HTTP_HOST=here"});
        EXPECT_EQ(
            (Strings{kInterface, "HTTP_HOST=here", "LANG=C", "PATH=/bin", "QUERY_STRING=a=b"}),
            Shown());
        EXPECT_STREQ("a=b", getenv("QUERY_STRING"));
    });
}

TEST(Environment, LeavesOutWhatTheServersOwnCallerWasAsked) {
    InProcessWith(
        {"PATH=/bin", "HTTP_COOKIE=id=x", "REQUEST_METHOD=GET", "QUERY_STRING=a", "REMOTE_USER=u",
         "SCRIPT_NAME=s", "HTTPS=on", "task_id=t", "task_user=u", "full_task_id=f",
         "NOTIFY_SOCKET=/run/n", "LISTEN_FDS=1", "TALO_WEBAPI_USERNAME=u", "WITHOUT"},
        [] {
            Environment environment;
            environment.Enter({});
            EXPECT_EQ((Strings{kInterface, "PATH=/bin"}), Shown());
            environment.Leave();
            EXPECT_EQ(Strings{"PATH=/bin"}, Shown());
        });
}

TEST(Environment, KeepsFromTheRequestWhatMayNotComeFromAClient) {
    InProcessWith({"PATH=/bin"}, [] {
        Environment environment;
        environment.Enter({"HTTP_PROXY=http://evil", "task_id=t", "task_user=u", "full_task_id=f",
                           "SCGI=1", "HTTP_PROXY_X=kept"});
        EXPECT_EQ((Strings{kInterface, "HTTP_PROXY_X=kept", "PATH=/bin"}), Shown());
    });
}

TEST(Environment, ShowsTheLastOfARepeatedVariable) {
    InProcessWith({"LANG=C"}, [] {
        Environment environment;
        environment.Enter({"HTTP_X=1", "LANG=de", "HTTP_X=2"});
        EXPECT_EQ((Strings{kInterface, "HTTP_X=2", "LANG=de"}), Shown());
    });
}

TEST(Environment, LeavesTheWebServerToNameTheInterface) {
    InProcessWith({"GATEWAY_INTERFACE=of the caller"}, [] {
        Environment environment;
        environment.Enter({"GATEWAY_INTERFACE=CGI/1.2"});
        EXPECT_EQ(Strings{"GATEWAY_INTERFACE=CGI/1.2"}, Shown());
        environment.Enter({});
        EXPECT_EQ(Strings{kInterface}, Shown());
    });
}

TEST(Environment, ForgetsARequestAndWhatItHasSet) {
    InProcessWith({"LANG=C"}, [] {
        Environment environment;
        environment.Enter({"HTTP_X=1"});
        (void)setenv("HTTP_COOKIE", "id=1", 1);
        (void)setenv("LANG", "de", 1);
        (void)unsetenv("HTTP_X");
        environment.Leave();
        EXPECT_EQ(Strings{"LANG=C"}, Shown());
        environment.Enter({"HTTP_X=2"});
        EXPECT_EQ((Strings{kInterface, "HTTP_X=2", "LANG=C"}), Shown());
        (void)clearenv();
        environment.Enter({"HTTP_X=3"});
        EXPECT_EQ((Strings{kInterface, "HTTP_X=3", "LANG=C"}), Shown());
    });
}

TEST(Environment, CostsNoMemoryPerRequest) {
    InProcessWith({"LANG=C"}, [] {
        Environment environment;
        const auto request = [&](int number) {
            environment.Enter({"HTTP_COOKIE=" + std::string(100, 'c') + std::to_string(number),
                               "HTTP_X=" + std::string(1000, 'x')});
            environment.Leave();
        };
        // The allocator keeps some of what was freed, and calls that used.
        for (int number = 900; number < 1000; ++number) {
            request(number);
        }
        const size_t before = mallinfo2().uordblks;
        for (int number = 1; number < 1000; ++number) {
            request(number);
        }
        EXPECT_EQ(before, mallinfo2().uordblks);
    });
}

TEST(Environment, GoesWithWhatTheRequestHasSet) {
    InProcessWith({"PATH=/bin", "HTTP_HOST=elsewhere"}, [] {
        {
            Environment environment;
            environment.Enter({"QUERY_STRING=a=b"});
            EXPECT_EQ(0, setenv("HTTP_COOKIE", "id=x", 1));
        }
        EXPECT_EQ((Strings{"HTTP_HOST=elsewhere", "PATH=/bin"}), Shown());
    });
}
