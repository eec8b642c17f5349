#include <fcntl.h>
#include <unistd.h>

#include <cstdlib>
#include <fstream>
#include <functional>
#include <thread>

#include "tests/host/relay/RelayFixture.h"
#include "tests/support/Child.h"
#include "tests/support/Json.h"

namespace {

using support::Parse;
using talo::RelayError;

// A pipe as a web server has it, into which a thread writes.
class Feed {
  public:
    explicit Feed(const std::function<void(int)>& write) : ends_() {
        EXPECT_EQ(pipe2(ends_, O_CLOEXEC), 0);
        stream_ = fdopen(ends_[0], "r");
        writer_ = std::thread([this, write] {
            write(ends_[1]);
            (void)close(ends_[1]);
        });
    }
    ~Feed() {
        writer_.join();
        (void)fclose(stream_);
    }
    Feed(const Feed&) = delete;
    Feed& operator=(const Feed&) = delete;
    FILE* Stream() const {
        return stream_;
    }

  private:
    int ends_[2];
    FILE* stream_ = nullptr;
    std::thread writer_;
};

void Write(int to, const std::string& text) {
    EXPECT_EQ(write(to, text.data(), text.size()), static_cast<ssize_t>(text.size()));
}

// Adler-32, as the target computes it.
class Sum {
  public:
    void Add(const std::string& text) {
        for (const char byte : text) {
            low_ = (low_ + static_cast<unsigned char>(byte)) % kPrime;
            high_ = (high_ + low_) % kPrime;
        }
    }
    unsigned Value() const {
        return high_ << 16 | low_;
    }

  private:
    static constexpr unsigned kPrime = 65521;
    unsigned low_ = 1;
    unsigned high_ = 0;
};

std::string Piece(unsigned number) {
    std::string piece(1 << 20, '\0');
    unsigned value = number;
    for (char& byte : piece) {
        value = value * 1664525 + 1013904223;
        byte = static_cast<char>(value >> 24);
    }
    return piece;
}

class Upload : public RelayTest {
  protected:
    Json::Value Seen() const {
        const std::vector<Json::Value> requests = target.Requests("TALO.Test");
        EXPECT_EQ(requests.size(), 1);
        return requests.empty() ? Json::Value() : requests[0];
    }
};

TEST_F(Upload, GoesOnAsItCame) {
    const std::string body("--xyz\r\n\0\xFF end", 14);
    const Outcome outcome = RelayTest::Upload(body);
    EXPECT_EQ(outcome.error, 0);
    EXPECT_EQ(outcome.answer, "{\"success\":true}");
    Sum sum;
    sum.Add(body);
    EXPECT_EQ(Seen()["sum"].asUInt(), sum.Value());
    EXPECT_EQ(Seen()["line"], "POST /webapi/entry.cgi?api=TALO.Test&version=3&method=do HTTP/1.1");
    EXPECT_EQ(HeaderOf(Seen(), "Content-Type"), "multipart/form-data; boundary=xyz");
    EXPECT_EQ(HeaderOf(Seen(), "Content-Length"), "14");
    EXPECT_EQ(HeaderOf(Seen(), "Transfer-Encoding"), "none");
    EXPECT_EQ(HeaderOf(Seen(), "Expect"), "none");
    EXPECT_EQ(HeaderOf(Seen(), "X-Relay-Hops"), "1");
}

TEST_F(Upload, GoesBehindAQueryOfTheUrl) {
    talo::Node node = NodeOf(target);
    node.url += "?relay_nd=7";
    Enter(node);
    EXPECT_EQ(RelayTest::Upload("body").error, 0);
    EXPECT_EQ(Seen()["line"],
              "POST /webapi/entry.cgi?relay_nd=7&api=TALO.Test&version=3&method=do HTTP/1.1");
}

TEST_F(Upload, OpensASessionRightBeforeOverTheSameConnection) {
    EXPECT_EQ(Call().error, 0);
    EXPECT_EQ(RelayTest::Upload("body").error, 0);
    const std::vector<Json::Value> requests = target.Requests();
    ASSERT_EQ(requests.size(), 4);
    EXPECT_EQ(requests[2]["api"], "TALO.Relay");
    EXPECT_EQ(HeaderOf(requests[3], "Cookie"), "id=session-2");
    EXPECT_EQ(requests[2]["connection"], requests[3]["connection"]);
}

TEST_F(Upload, IsNotRepeated) {
    target.Plan(R"({"TALO.Test":{"body":"no","headers":{"x-request-error":"noprivilege"}}})");
    EXPECT_EQ(RelayTest::Upload("body").answer, "no");
    EXPECT_EQ(target.Requests().size(), 2);
}

TEST_F(Upload, MayBeEmpty) {
    EXPECT_EQ(RelayTest::Upload("").error, 0);
    EXPECT_EQ(HeaderOf(Seen(), "Content-Length"), "0");
}

TEST_F(Upload, MayHaveNoType) {
    Json::Value headers(Json::objectValue);
    headers["Content-Type"] = Json::Value();
    headers["Content-Length"] = "4";
    const Stream stream("body");
    TALO::CredRequestMgr manager;
    EXPECT_EQ(manager.AddRelayRequest(2, "TALO.Test", 1, "do", headers, stream.Get(), nullptr), 0);
    EXPECT_TRUE(manager.Run());
    EXPECT_EQ(HeaderOf(Seen(), "Content-Type"), "none");
}

TEST_F(Upload, TakesNoMoreOfTheStreamThanTheBody) {
    const Stream stream("bodyrest");
    EXPECT_EQ(RelayTest::Upload(stream.Get(), "4").error, 0);
    EXPECT_EQ(stream.Rest(), "rest");
}

TEST_F(Upload, BeginsWhereTheStreamIs) {
    const Stream stream("head body");
    char head[5];
    ASSERT_EQ(fread(head, 1, sizeof head, stream.Get()), sizeof head);
    EXPECT_EQ(RelayTest::Upload(stream.Get(), 4).error, 0);
    Sum sum;
    sum.Add("body");
    EXPECT_EQ(Seen()["sum"].asUInt(), sum.Value());
}

TEST_F(Upload, BeginsWithWhatAPipesStreamHasReadAheadAndPutBack) {
    const Feed feed([](int to) { Write(to, "head body and more"); });
    char head[5];
    ASSERT_EQ(fread(head, 1, sizeof head, feed.Stream()), sizeof head);
    ASSERT_EQ(ungetc('a', feed.Stream()), 'a');
    ASSERT_EQ(ungetc('b', feed.Stream()), 'b');
    EXPECT_EQ(RelayTest::Upload(feed.Stream(), 10).error, 0);
    Sum sum;
    sum.Add("babody and");
    EXPECT_EQ(Seen()["sum"].asUInt(), sum.Value());
    EXPECT_EQ(fgetc(feed.Stream()), ' ');
}

TEST_F(Upload, WaitsForAClientThatSendsInPieces) {
    const Feed feed([](int to) {
        for (int round = 0; round < 5; ++round) {
            Write(to, "piece");
            std::this_thread::sleep_for(std::chrono::milliseconds(50));
        }
    });
    EXPECT_EQ(RelayTest::Upload(feed.Stream(), 25).error, 0);
    EXPECT_EQ(Seen()["came"].asInt(), 25);
}

TEST_F(Upload, EndsWithABodyThatEndsTooEarly) {
    const Stream stream("bod");
    EXPECT_EQ(RelayTest::Upload(stream.Get(), 4).error, Number(RelayError::kBadBody));
    const Feed feed([](int to) { Write(to, "bod"); });
    EXPECT_EQ(RelayTest::Upload(feed.Stream(), 4).error, Number(RelayError::kBadBody));
}

TEST_F(Upload, IsLimitedInTimeAlsoWhileTheClientSaysNothing) {
    int ends[2];
    ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
    FILE* stream = fdopen(ends[0], "r");
    EXPECT_EQ(RelayTest::Upload(stream, 4, nullptr, 1).error, Number(RelayError::kTimedOut));
    (void)fclose(stream);
    (void)close(ends[1]);
}

TEST_F(Upload, DoesNotKeepAnotherCallWaitingForItsBody) {
    int ends[2];
    ASSERT_EQ(pipe2(ends, O_CLOEXEC), 0);
    FILE* stream = fdopen(ends[0], "r");
    Json::Value headers(Json::objectValue);
    headers["Content-Length"] = "4";
    TALO::CredRequestMgr manager;
    EXPECT_EQ(manager.AddRelayRequest(2, "TALO.Slow", 1, "do", headers, stream, nullptr), 0);
    EXPECT_EQ(manager.AddWebAPIRequest(2, "TALO.Test", 1, "do", Json::Value()), 1);
    // The body comes when the other call was seen.
    std::thread client([&] {
        for (int round = 0; round < 600 && target.Requests("TALO.Test").empty(); ++round) {
            std::this_thread::sleep_for(std::chrono::milliseconds(50));
        }
        Write(ends[1], target.Requests("TALO.Test").empty() ? "" : "body");
        (void)close(ends[1]);
    });
    EXPECT_TRUE(manager.Run());
    client.join();
    (void)fclose(stream);
}

TEST_F(Upload, WritesTheAnswerToTheGivenStream) {
    const Stream in("body");
    const Stream out("");
    target.Plan(R"({"TALO.Test":{"body":"told"}})");
    const Outcome outcome = RelayTest::Upload(in.Get(), 4, out.Get());
    EXPECT_EQ(outcome.error, 0);
    EXPECT_EQ(outcome.answer, "");
    rewind(out.Get());
    EXPECT_EQ(out.Rest(), "told");
}

TEST_F(Upload, WritesNothingOfAnErrorToTheGivenStream) {
    const Stream in("body");
    const Stream out("");
    target.Plan(R"({"TALO.Test":{"body":"told","status":500}})");
    EXPECT_EQ(RelayTest::Upload(in.Get(), 4, out.Get()).error, Number(RelayError::kStatus));
    rewind(out.Get());
    EXPECT_EQ(out.Rest(), "");
}

TEST_F(Upload, SurvivesAReaderOfTheAnswerThatHasGone) {
    const support::ChildResult child = support::InChild([&] {
        int ends[2];
        EXPECT_EQ(pipe2(ends, O_CLOEXEC), 0);
        FILE* out = fdopen(ends[1], "w");
        (void)setvbuf(out, nullptr, _IONBF, 0);
        (void)close(ends[0]);
        const Stream in("body");
        EXPECT_EQ(RelayTest::Upload(in.Get(), 4, out).error, Number(RelayError::kUnavailable));
        return 7;
    });
    EXPECT_EQ(child.status, 7);
}

struct SizeRow {
    const char* name;
    const char* headers;
};

class UnknownSize : public ::testing::TestWithParam<SizeRow> {};

TEST_P(UnknownSize, IsNotQueued) {
    const Stream stream("body");
    TALO::CredRequestMgr manager;
    EXPECT_LT(
        manager.AddRelayRequest(2, "A", 1, "m", Parse(GetParam().headers), stream.Get(), nullptr),
        0);
    EXPECT_EQ(manager.GetRequest(0), nullptr);
}

const SizeRow kSizes[] = {
    {"None", "{}"},
    {"Null", R"({"Content-Length":null})"},
    {"Empty", R"({"Content-Length":""})"},
    {"Negative", R"({"Content-Length":"-1"})"},
    {"Signed", R"({"Content-Length":"+1"})"},
    {"WithBlank", R"({"Content-Length":"4 "})"},
    {"Fraction", R"({"Content-Length":4.5})"},
    {"Huge", R"({"Content-Length":"9999999999999999999"})"},
    {"NoObject", "[4]"},
    {"TypeOfTwoLines", R"({"Content-Length":"4","Content-Type":"a\r\nX-Evil: 1"})"},
    {"TypeWithNul", R"({"Content-Length":"4","Content-Type":"a\u0000b"})"},
};

INSTANTIATE_TEST_SUITE_P(Sizes, UnknownSize, ::testing::ValuesIn(kSizes),
                         [](const auto& row) { return std::string(row.param.name); });

TEST_F(Upload, NeedsAStream) {
    Json::Value headers(Json::objectValue);
    headers["Content-Length"] = "4";
    TALO::CredRequestMgr manager;
    EXPECT_LT(manager.AddRelayRequest(2, "A", 1, "m", headers, nullptr, nullptr), 0);
}

// A target that answers before the body is whole.
constexpr long long kNeverWhole = 1LL << 40;

TEST_F(Upload, EndsWithAnAnswerThatComesEarly) {
    target.Plan(R"({"TALO.Test":{"early":true,"hold":true,"body":"{\"success\":false}"}})");
    FILE* zeros = fopen("/dev/zero", "re");
    const Outcome outcome = RelayTest::Upload(zeros, Json::Int64(kNeverWhole));
    EXPECT_EQ(outcome.error, 0);
    EXPECT_EQ(outcome.answer, "{\"success\":false}");
    (void)fclose(zeros);
}

TEST_F(Upload, EndsWithAnAnswerInChunksThatComesEarly) {
    for (const char* then : {"hold", "drain"}) {
        target.Plan(std::string(R"({"TALO.Test":{"early":true,"chunked":true,")") + then +
                    R"(":true,"body":"{\"success\":false}"}})");
        FILE* zeros = fopen("/dev/zero", "re");
        const Outcome outcome = RelayTest::Upload(zeros, Json::Int64(kNeverWhole));
        EXPECT_EQ(outcome.error, 0);
        EXPECT_EQ(outcome.answer, "{\"success\":false}");
        (void)fclose(zeros);
    }
}

TEST_F(Upload, TakesAnAnswerInChunks) {
    target.Plan(R"({"TALO.Test":{"chunked":true,"body":"not one but several"}})");
    EXPECT_EQ(RelayTest::Upload("body").answer, "not one but several");
}

TEST_F(Upload, EndsWithARefusalThatComesEarly) {
    target.Plan(R"({"TALO.Test":{"early":true,"status":413,"hold":true,"body":"too large"}})");
    FILE* zeros = fopen("/dev/zero", "re");
    EXPECT_EQ(RelayTest::Upload(zeros, Json::Int64(kNeverWhole)).error,
              Number(RelayError::kStatus));
    (void)fclose(zeros);
}

// Memory in use at most since the last call, in KiB.
long PeakSince() {
    long peak = 0;
    std::ifstream status("/proc/self/status");
    for (std::string line; std::getline(status, line);) {
        if (line.rfind("VmHWM:", 0) == 0) {
            peak = std::strtol(line.c_str() + 6, nullptr, 10);
        }
    }
    std::ofstream("/proc/self/clear_refs") << "5";
    return peak;
}

// KiB that a body of so many MiB may cost. The sanitizer keeps what was freed.
long MostGrowth(unsigned mebibytes) {
#ifdef __SANITIZE_ADDRESS__
    return static_cast<long>(mebibytes) * 768;
#else
    (void)mebibytes;
    return 1024;
#endif
}

// RELAY_MIB makes it longer.
TEST_F(Upload, IsNotHeldInMemory) {
    const char* wanted = std::getenv("RELAY_MIB");
    const unsigned pieces =
        static_cast<unsigned>(std::strtoul(wanted != nullptr ? wanted : "64", nullptr, 10));
    const std::string piece = Piece(pieces);
    const support::ChildResult child = support::InChild([&] {
        // The second time no library has to be loaded.
        EXPECT_EQ(RelayTest::Upload("body").error, 0);
        const Feed feed([&](int to) {
            for (unsigned number = 0; number < pieces; ++number) {
                for (size_t from = 0; from < piece.size();) {
                    const ssize_t put = write(to, &piece[from], piece.size() - from);
                    ASSERT_GT(put, 0);
                    from += static_cast<size_t>(put);
                }
            }
        });
        (void)PeakSince();
        const long before = PeakSince();
        EXPECT_EQ(RelayTest::Upload(feed.Stream(), Json::Int64(pieces) << 20, nullptr, 600).error,
                  0);
        EXPECT_LT(PeakSince() - before, MostGrowth(pieces));
        return 0;
    });
    EXPECT_EQ(child.status, 0) << child.output;
    const std::vector<Json::Value> seen = target.Requests("TALO.Test");
    ASSERT_EQ(seen.size(), 2);
    EXPECT_EQ(seen[1]["came"].asInt64(), Json::Int64(pieces) << 20);
    if (pieces <= 64) {
        Sum sum;
        for (unsigned number = 0; number < pieces; ++number) {
            sum.Add(piece);
        }
        EXPECT_EQ(seen[1]["sum"].asUInt(), sum.Value());
    }
}

}  // namespace
