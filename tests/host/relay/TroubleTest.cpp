#include <fcntl.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <chrono>
#include <cstring>
#include <filesystem>
#include <iterator>
#include <limits>
#include <thread>

#include "platform/Paths.h"
#include "tests/host/relay/RelayFixture.h"
#include "tests/support/Child.h"

namespace {

namespace fs = std::filesystem;
using talo::RelayError;

// A loopback port, on which somebody may listen who never says a word.
class Port {
  public:
    explicit Port(bool listens) : socket_(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
        struct sockaddr_in address = {};
        socklen_t size = sizeof address;
        address.sin_family = AF_INET;
        address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
        EXPECT_EQ(bind(socket_, reinterpret_cast<struct sockaddr*>(&address), size), 0);
        EXPECT_EQ(getsockname(socket_, reinterpret_cast<struct sockaddr*>(&address), &size), 0);
        number_ = ntohs(address.sin_port);
        if (listens) {
            EXPECT_EQ(listen(socket_, 8), 0);
        }
    }
    ~Port() {
        (void)close(socket_);
    }
    Port(const Port&) = delete;
    Port& operator=(const Port&) = delete;

    std::string Url() const {
        return "https://127.0.0.1:" + std::to_string(number_) + "/";
    }

    // Takes one connection and says that, then ends it.
    std::thread Say(const std::string& words) {
        return std::thread([this, words] {
            const int caller = accept4(socket_, nullptr, nullptr, SOCK_CLOEXEC);
            char hello[64];
            (void)!read(caller, hello, sizeof hello);
            (void)!write(caller, words.data(), words.size());
            (void)shutdown(caller, SHUT_WR);
            while (read(caller, hello, sizeof hello) > 0) {
            }
            (void)close(caller);
        });
    }

  private:
    int socket_;
    int number_ = 0;
};

class Trouble : public RelayTest {
  protected:
    int ErrorAt(const std::string& url, long seconds = 60) {
        talo::Node node = NodeOf(target);
        node.url = url;
        Enter(node);
        return Call(Json::Value(), 2, seconds).error;
    }
    int ErrorOf(const std::string& plan, long seconds = 60) {
        target.Plan(plan);
        const Outcome outcome = Call(Json::Value(), 2, seconds);
        EXPECT_EQ(outcome.answer, "");
        return outcome.error;
    }
};

TEST_F(Trouble, IsAPortThatNobodyListensOn) {
    const Port port(false);
    EXPECT_EQ(ErrorAt(port.Url()), Number(RelayError::kNotReached));
}

TEST_F(Trouble, IsAnApplianceThatHasGone) {
    EXPECT_EQ(Call().error, 0);
    target.Stop();
    EXPECT_EQ(Call().error, Number(RelayError::kNotReached));
}

TEST_F(Trouble, IsANameWithoutAnAddress) {
    EXPECT_EQ(ErrorAt("https://nas.invalid/"), Number(RelayError::kNotReached));
}

TEST_F(Trouble, IsSomebodyWhoTakesTheConnectionAndSaysNothing) {
    const Port port(true);
    EXPECT_EQ(ErrorAt(port.Url(), 1), Number(RelayError::kTimedOut));
}

TEST_F(Trouble, IsSomebodyWhoDoesNotSpeakTls) {
    Port port(true);
    std::thread other = port.Say("HTTP/1.1 400 Bad Request\r\n\r\n");
    EXPECT_EQ(ErrorAt(port.Url()), Number(RelayError::kNotReached));
    other.join();
}

TEST_F(Trouble, IsAnApplianceThatDoesNotAnswerInTime) {
    EXPECT_EQ(ErrorOf(R"({"TALO.Relay":{"silent":true}})", 1), Number(RelayError::kTimedOut));
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"silent":true}})", 1), Number(RelayError::kTimedOut));
}

TEST_F(Trouble, IsAnApplianceThatAnswersOneByteASecond) {
    EXPECT_EQ(
        ErrorOf(R"({"TALO.Test":{"drip":1,"body":"0123456789012345678901234567890123456"}})", 2),
        Number(RelayError::kTimedOut));
}

// The limit is for the call, not for each of the requests that make it up.
TEST_F(Trouble, IsALimitThatIsUsedUpByTheOpening) {
    target.Plan(R"({"TALO.Relay":{"delay":1.2},"TALO.Test":{"delay":1.2}})");
    EXPECT_EQ(Call(Json::Value(), 2, 2).error, Number(RelayError::kTimedOut));
    EXPECT_EQ(target.Requests("TALO.Test").size(), 1);
}

TEST_F(Trouble, IsNotASlowApplianceWithoutALimit) {
    target.Plan(R"({"TALO.Test":{"delay":0.3}})");
    for (const long seconds : {0L, -1L, -1000000L}) {
        EXPECT_EQ(Call(Json::Value(), 2, seconds).error, 0);
    }
}

TEST_F(Trouble, IsNotALimitOfMoreSecondsThanThereAre) {
    EXPECT_EQ(Call(Json::Value(), 2, std::numeric_limits<long>::max()).error, 0);
}

TEST_F(Trouble, IsACertificateOfAnotherAuthority) {
    talo::Node node = NodeOf(target);
    node.authority = certificates.OtherAuthority();
    Enter(node);
    EXPECT_EQ(Call().error, Number(RelayError::kNotTrusted));
    EXPECT_TRUE(target.Requests().empty());
}

TEST_F(Trouble, IsACertificateThatTheSystemDoesNotKnow) {
    talo::Node node = NodeOf(target);
    node.authority = "";
    Enter(node);
    EXPECT_EQ(Call().error, Number(RelayError::kNotTrusted));
}

TEST_F(Trouble, IsAnAuthorityThatIsNotThere) {
    talo::Node node = NodeOf(target);
    node.authority = "/nonexistent";
    Enter(node);
    EXPECT_EQ(Call().error, Number(RelayError::kNotTrusted));
}

TEST_F(Trouble, IsACertificateForAnotherName) {
    const Target other(certificates, "DNS:nas9.example");
    Enter(NodeOf(other));
    EXPECT_EQ(Call().error, Number(RelayError::kNotTrusted));
    EXPECT_TRUE(other.Requests().empty());
}

TEST_F(Trouble, IsAnotherKeyThanThePinnedOne) {
    talo::Node node = NodeOf(target);
    node.pin = certificates.PinOf(target.Certificate());
    Enter(node);
    EXPECT_EQ(Call().error, 0);
    node.pin = certificates.PinOf(certificates.Make("stranger"));
    Enter(node);
    EXPECT_EQ(Call().error, Number(RelayError::kNotTrusted));
    EXPECT_EQ(target.Requests("TALO.Test").size(), 1);
}

// The certificate itself as its own authority.
TEST_F(Trouble, IsNotACertificateThatIsTrustedByItself) {
    talo::Node node = NodeOf(target);
    node.authority = target.Certificate();
    Enter(node);
    EXPECT_EQ(Call().error, 0);
}

TEST_F(Trouble, IsAStatusOtherThan200) {
    for (const char* status : {"500", "404", "201", "204", "301"}) {
        EXPECT_EQ(ErrorOf(std::string(R"({"TALO.Test":{"status":)") + status + "}}"),
                  Number(RelayError::kStatus))
            << status;
    }
    EXPECT_EQ(ErrorOf(R"({"TALO.Relay":{"status":500},"TALO.Test":
                         {"status":401,"headers":{"x-request-error":"unauth"}}})"),
              Number(RelayError::kStatus));
}

TEST_F(Trouble, IsARedirectWhichIsNotFollowed) {
    const Target elsewhere(certificates);
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"status":307,"headers":{"Location":")" + elsewhere.Url() +
                      R"("}}})"),
              Number(RelayError::kStatus));
    EXPECT_TRUE(elsewhere.Requests().empty());
}

TEST_F(Trouble, IsAnAnswerThatIsCut) {
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"body":"0123456789","cut":5}})"),
              Number(RelayError::kBroken));
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"close":true}})"), Number(RelayError::kBroken));
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"close":true},"TALO.Relay":{"close":true}})"),
              Number(RelayError::kBroken));
}

// It may have been carried out.
TEST_F(Trouble, DoesNotMakeACallTwiceBecauseItsConnectionEnded) {
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"close":true}})"), Number(RelayError::kBroken));
    EXPECT_EQ(target.Requests("TALO.Test").size(), 1);
}

TEST_F(Trouble, IsNotAConnectionThatEndsAfterTheOpening) {
    target.Plan(R"({"TALO.Relay":{"goodbye":true,"headers":{"Connection":"close"}}})");
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(Upload("body").error, 0);
}

TEST_F(Trouble, IsAnAnswerOfAGigabyte) {
    const auto start = std::chrono::steady_clock::now();
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"bytes":1073741824}})"), Number(RelayError::kTooLong));
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"bytes":1073741824,"sizeless":true}})"),
              Number(RelayError::kTooLong));
    EXPECT_EQ(ErrorOf(R"({"TALO.Relay":{"bytes":1073741824,"sizeless":true},
                          "TALO.Test":{"headers":{"x-request-error":"unauth"}}})"),
              Number(RelayError::kTooLong));
    EXPECT_LT(std::chrono::steady_clock::now() - start, std::chrono::seconds(30));
}

TEST_F(Trouble, IsAnAnswerLongerThanTheConfiguredLimit) {
    Configure("relay_answer_limit=\"1000\"");
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"bytes":1001,"sizeless":true}})"),
              Number(RelayError::kTooLong));
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"bytes":1001}})"), Number(RelayError::kTooLong));
    target.Plan(R"({"TALO.Test":{"body":")" + std::string(1000, 'x') + R"("}})");
    EXPECT_EQ(Call().answer, std::string(1000, 'x'));
}

TEST_F(Trouble, IsAnAnswerOfHeadersWithoutEnd) {
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"headerBytes":200000}})"), Number(RelayError::kTooLong));
}

TEST_F(Trouble, IsAFileOfAppliancesThatCannotBeUsed) {
    fs::permissions(TALO_NODES_FILE, fs::perms::others_write, fs::perm_options::add);
    EXPECT_EQ(Call().error, Number(RelayError::kUnavailable));
}

TEST_F(Trouble, DoesNotEndAProcessThatWouldDieOfAClosedConnection) {
    target.Plan(R"({"TALO.Test":{"early":true,"close":true}})");
    const support::ChildResult child = support::InChild([&] {
        FILE* zeros = fopen("/dev/zero", "re");
        EXPECT_EQ(Upload(zeros, Json::Int64(1) << 40).error, Number(RelayError::kBroken));
        (void)fclose(zeros);
        return 7;
    });
    EXPECT_EQ(child.status, 7);
}

size_t OpenDescriptors() {
    const fs::directory_iterator open("/proc/self/fd");
    return static_cast<size_t>(std::distance(begin(open), end(open)));
}

TEST_F(Trouble, LeavesNoDescriptorOpen) {
    (void)Call();
    const size_t before = OpenDescriptors();
    (void)Call();
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"silent":true}})", 1), Number(RelayError::kTimedOut));
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"close":true}})"), Number(RelayError::kBroken));
    EXPECT_EQ(ErrorOf(R"({"TALO.Test":{"bytes":1073741824}})"), Number(RelayError::kTooLong));
    EXPECT_EQ(OpenDescriptors(), before);
}

// What a thread starts meanwhile must not get hold of the connection.
TEST_F(Trouble, HandsNoConnectionToAProgramThatIsStartedMeanwhile) {
    target.Plan(R"({"TALO.Test":{"meet":2}})");
    std::thread caller([this] {
        LogIn("anna", "ger");
        EXPECT_EQ(Call().error, 0);
    });
    for (int round = 0; round < 600 && target.Requests("TALO.Test").empty(); ++round) {
        std::this_thread::sleep_for(std::chrono::milliseconds(50));
    }
    size_t sockets = 0;
    for (const fs::directory_entry& entry : fs::directory_iterator("/proc/self/fd")) {
        const int number = std::stoi(entry.path().filename());
        struct sockaddr_storage address = {};
        socklen_t size = sizeof address;
        if (getpeername(number, reinterpret_cast<struct sockaddr*>(&address), &size) == 0 &&
            address.ss_family == AF_INET) {
            EXPECT_TRUE((fcntl(number, F_GETFD) & FD_CLOEXEC) != 0);
            ++sockets;
        }
    }
    EXPECT_EQ(sockets, 1);
    EXPECT_EQ(Call().error, 0);  // which the other one waits for
    caller.join();
}

}  // namespace
