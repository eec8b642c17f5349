#include "src/runner/ProcessGuards.h"

#include <sys/resource.h>

#include <iostream>
#include <sstream>

#include "tests/runner/RunnerFixture.h"
#include "tests/runner/SystemProbe.h"
#include "tests/support/Child.h"

namespace {

using runner::Parse;

// std::cin and std::cout lead into texts as long as it lives.
class Streams {
  public:
    explicit Streams(const std::string& text)
        : in(text), input(std::cin.rdbuf(in.rdbuf())), output(std::cout.rdbuf(out.rdbuf())) {}
    ~Streams() {
        std::cin.rdbuf(input);
        std::cout.rdbuf(output);
    }

    bool AreInPlace() const {
        return std::cin.rdbuf() == in.rdbuf() && std::cout.rdbuf() == out.rdbuf() &&
               std::cin.good() && std::cout.good();
    }

    std::istringstream in;
    std::ostringstream out;

  private:
    std::streambuf* input;
    std::streambuf* output;
};

class MethodStreams : public runner::Fixture {
  protected:
    void SetUp() override {
        Install("Test.Basic");
        Install("Test.Check");
    }
};

TEST_F(MethodStreams, TakeNoStrayPrint) {
    Streams streams("");
    const Json::Value body = Call("Test.Basic", 1, "print", Parse(R"({"text": "stray"})"));
    EXPECT_EQ(body["data"], Parse(R"({"good": false})"));
    EXPECT_EQ(streams.out.str(), "");
    EXPECT_TRUE(streams.AreInPlace());
}

TEST_F(MethodStreams, TakeThePrintOfAMethodThatMayDownload) {
    Streams streams("");
    const Json::Value body = Call("Test.Basic", 1, "printRaw", Parse(R"({"text": "wanted"})"));
    EXPECT_EQ(body["data"], Parse(R"({"good": true})"));
    EXPECT_EQ(streams.out.str(), "wanted");
    EXPECT_TRUE(streams.AreInPlace());
}

TEST_F(MethodStreams, GiveNoInput) {
    Streams streams("the body");
    EXPECT_EQ(Call("Test.Basic", 1, "readInput")["data"], Parse(R"({"text": "", "end": true})"));
    EXPECT_TRUE(streams.AreInPlace());
    EXPECT_EQ(streams.in.tellg(), 0);
}

TEST_F(MethodStreams, GiveTheInputToAMethodThatMayUpload) {
    Streams streams("the body");
    EXPECT_EQ(Call("Test.Basic", 1, "upload")["data"]["text"], Json::Value("the body"));
}

TEST_F(MethodStreams, AreTheRealOnesToo) {
    const support::ChildResult result = support::InChild(
        [this] {
            std::cout << "before " << std::flush;
            (void)Call("Test.Basic", 1, "print", Parse(R"({"text": "stray "})"));
            (void)Call("Test.Basic", 1, "printRaw", Parse(R"({"text": "wanted "})"));
            EXPECT_EQ(Call("Test.Basic", 1, "readInput")["data"]["text"], Json::Value(""));
            EXPECT_EQ(Call("Test.Basic", 1, "upload")["data"]["text"], Json::Value("the body"));
            std::cout << "after" << std::flush;
            return 0;
        },
        "the body");
    EXPECT_EQ(result.status, 0);
    EXPECT_EQ(result.output, "before wanted after");
}

TEST_F(MethodStreams, ComeBackFromEveryWayOut) {
    Streams streams("text");
    const std::pair<const char*, const char*> calls[] = {
        {"Test.Check", "stop"},        {"Test.Check", "throwException"},
        {"Test.Basic", "notInTable"},  {"Test.Basic", "throwException"},
        {"Test.Basic", "throwNumber"}, {"Test.Basic", "nothing"},
    };
    for (const auto& [api, method] : calls) {
        (void)Call(api, 1, method);
        EXPECT_TRUE(streams.AreInPlace()) << api << " " << method;
    }
}

TEST_F(MethodStreams, AreLeftAloneByARequestThatIsRefused) {
    Streams streams("text");
    (void)Call("Test.Basic", 9, "ok");
    EXPECT_TRUE(streams.AreInPlace());
}

TEST(StandardStreams, DisconnectOnlyWhatIsAsked) {
    Streams streams("in");
    {
        const TALO::StandardStreams guard(true, false);
        std::string word;
        EXPECT_FALSE(std::cin >> word);
        EXPECT_TRUE(std::cout << "out");
    }
    {
        const TALO::StandardStreams guard(false, true);
        std::string word;
        EXPECT_TRUE(std::cin >> word);
        EXPECT_FALSE(std::cout << "lost" << std::flush);
        EXPECT_EQ(word, "in");
    }
    EXPECT_EQ(streams.out.str(), "out");
    EXPECT_TRUE(std::cout.good());
}

TEST(StandardStreams, ClearTheErrorStateWhenTheyComeBack) {
    Streams streams("");
    std::cin.setstate(std::ios::failbit);
    std::cout.setstate(std::ios::badbit);
    { const TALO::StandardStreams guard(true, true); }
    EXPECT_TRUE(streams.AreInPlace());
}

// The niceness that a method sees, under a description of that priority; the
// changes that were asked for are in probe::Priorities().
class MethodPriority : public runner::Fixture {
  protected:
    int Seen(const Json::Value& priority, const std::string& method = "process") {
        Install("Test.Basic");
        TALO::APIRequest request(Post("Test.Basic", 1, method));
        TALO::APIResponse response(&request);
        (void)Runner().InitLibDesc(Runner().libDesc, "Test.Basic");
        Runner().libDesc["Test.Basic"]["priority"] = priority;
        probe::Priorities().clear();
        (void)Runner().Process(&request, &response);
        const Json::Value nice = response.GetBody()["data"]["nice"];
        return nice.isInt() ? nice.asInt() : -100;
    }
};

TEST_F(MethodPriority, IsTheDescriptionsAndIsPutBack) {
    runner::InChild([this] {
        const int before = getpriority(PRIO_PROCESS, 0);
        EXPECT_EQ(Seen(before + 3), before + 3);
        EXPECT_EQ(probe::Priorities(), std::vector<int>({before + 3, before}));
    });
}

TEST_F(MethodPriority, IsNotTouchedWhenItIsTheProcesssOwn) {
    runner::InChild([this] {
        const int before = getpriority(PRIO_PROCESS, 0);
        EXPECT_EQ(Seen(before), before);
        EXPECT_TRUE(probe::Priorities().empty());
    });
}

TEST_F(MethodPriority, ReadsAsAnInteger) {
    runner::InChild([this] {
        (void)setpriority(PRIO_PROCESS, 0, 4);
        EXPECT_EQ(getpriority(PRIO_PROCESS, 0), 4);
        (void)Seen(Json::Value());
        EXPECT_EQ(probe::Priorities(), std::vector<int>({0, 4})) << "null reads as 0";
    });
}

TEST_F(MethodPriority, IsPutBackBehindAFailure) {
    runner::InChild([this] {
        const int before = getpriority(PRIO_PROCESS, 0);
        for (const char* method : {"throwException", "throwNumber", "notInTable", "nothing"}) {
            (void)Seen(before + 2, method);
            EXPECT_EQ(probe::Priorities(), std::vector<int>({before + 2, before})) << method;
        }
    });
}

TEST_F(MethodPriority, IsPutBackBehindAFailedCheck) {
    runner::InChild([this] {
        const int before = getpriority(PRIO_PROCESS, 0);
        Install("Test.Check");
        (void)Runner().InitLibDesc(Runner().libDesc, "Test.Check");
        Runner().libDesc["Test.Check"]["priority"] = before + 2;
        for (const char* method : {"stop", "throwException"}) {
            TALO::APIRequest request(Post("Test.Check", 1, method));
            TALO::APIResponse response(&request);
            probe::Priorities().clear();
            EXPECT_EQ(Runner().Process(&request, &response), 0);
            EXPECT_EQ(probe::Priorities(), std::vector<int>({before + 2, before})) << method;
        }
    });
}

}  // namespace
