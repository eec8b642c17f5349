#include <stdlib.h>
#include <unistd.h>

#include <cstdio>
#include <memory>
#include <string>
#include <type_traits>
#include <vector>

#include "src/response/APIDownloadPrivate.h"
#include "tests/fake/FakePlatform.h"
#include "tests/response/Fixture.h"
#include "tests/support/Child.h"
#include "tests/support/Json.h"
#include "tests/support/PrivateMember.h"
#include "webapi/APIDownload.h"

namespace support {

struct DownloadPrivate {
    typedef TALO::APIDownloadPrivate* TALO::APIDownload::*Type;
    friend Type Find(DownloadPrivate);
};
template struct PrivateMember<DownloadPrivate, &TALO::APIDownload::d>;

}  // namespace support

using support::Parse;
using TALO::APIDownload;
using TALO::APIDownloadPrivate;
using TALO::APIResponse;

namespace {

const char kVariable[] = "MOD_X_SENDFILE_ENABLED";
const char kContentType[] = "Content-type: text/html; charset=\"UTF-8\"\r\n";

APIDownloadPrivate* PrivateOf(const APIDownload& download) {
    return download.*Find(support::DownloadPrivate());
}

// A response whose headers are printed before what the platform writes, "<file>".
class Download : public Response {
  protected:
    Download() {
        fake::Reset();
        fake::Now().outputMarker = "<file>";
        (void)unsetenv(kVariable);
    }
    ~Download() override {
        (void)unsetenv(kVariable);
        fake::Reset();
    }

    // What a process writes that does this.
    static std::string Written(const std::function<void()>& steps) {
        const support::ChildResult result = support::InChild([&steps] {
            steps();
            return 0;
        });
        EXPECT_EQ(result.status, 0) << result.output;
        return result.output;
    }

    static const fake::OutputCall& LastCall() {
        return fake::Now().outputCalls.back();
    }
};

TEST_F(Download, WithoutAResponseMakesOneWithTheDefaultHeader) {
    const APIDownload download;
    const APIDownloadPrivate* d = PrivateOf(download);
    ASSERT_NE(d->response, nullptr);
    EXPECT_TRUE(d->ownsResponse);
    EXPECT_EQ(d->response->GetHeaders(),
              Parse(R"({"Content-type": "text/html; charset=\"UTF-8\""})"));
    EXPECT_EQ(Written([] { (void)APIDownload().Output("/file"); }),
              std::string(kContentType) + "<file>");
}

TEST_F(Download, LeavesTheResponseThatItWasGivenToItsOwner) {
    auto given = std::make_unique<APIResponse>(nullptr);
    {
        APIDownload download(given.get());
        EXPECT_EQ(PrivateOf(download)->response, given.get());
        EXPECT_FALSE(PrivateOf(download)->ownsResponse);
        EXPECT_TRUE(download.SetHeader("X-One", "1"));
    }
    EXPECT_EQ(given->GetHeader("X-One", ""), "1");
}

struct Variable {
    const char* value;
    bool enabled;
};

TEST_F(Download, MayUseXSendFileWhenTheVariableIsYesInAnyCase) {
    for (const Variable& row : std::vector<Variable>{{"yes", true},
                                                     {"YES", true},
                                                     {"Yes", true},
                                                     {"yEs", true},
                                                     {"", false},
                                                     {"1", false},
                                                     {"true", false},
                                                     {"on", false},
                                                     {"no", false},
                                                     {"y", false},
                                                     {"yes ", false},
                                                     {" yes", false},
                                                     {"yesyes", false}}) {
        ASSERT_EQ(setenv(kVariable, row.value, 1), 0);
        EXPECT_EQ(APIDownload::GetXSendFileEnabled(), row.enabled) << row.value;
    }
    ASSERT_EQ(unsetenv(kVariable), 0);
    EXPECT_FALSE(APIDownload::GetXSendFileEnabled());
}

TEST_F(Download, TakesTheVariableOutOfTheEnvironmentWhateverItsValue) {
    for (const char* value : {"YES", "no", ""}) {
        ASSERT_EQ(setenv(kVariable, value, 1), 0);
        EXPECT_EQ(APIDownload::SetXSendFileDisabled(), 0);
        EXPECT_EQ(getenv(kVariable), nullptr);
        EXPECT_FALSE(APIDownload::GetXSendFileEnabled());
    }
}

TEST_F(Download, SucceedsInDisablingWhatWasNotThere) {
    EXPECT_EQ(APIDownload::SetXSendFileDisabled(), 0);
    EXPECT_EQ(getenv(kVariable), nullptr);
}

TEST_F(Download, SetsAHeaderOfTheResponse) {
    APIDownload download(&response);
    EXPECT_TRUE(download.SetHeader("X-One", "1"));
    EXPECT_TRUE(download.SetHeader("X-One", "2"));
    EXPECT_TRUE(download.SetHeader("X-Empty", ""));
    EXPECT_FALSE(download.SetHeader("", "nameless"));
    EXPECT_EQ(response.GetHeader("X-One", ""), "2");
    EXPECT_EQ(response.GetHeader("X-Empty", "none"), "");
    EXPECT_EQ(response.GetHeaders().size(), 3u);
}

TEST_F(Download, ReplacesTheContentTypeUnderExactlyItsName) {
    APIDownload download(&response);
    EXPECT_TRUE(download.SetHeader("Content-Type", "a/b"));
    EXPECT_TRUE(download.SetHeader("Content-type", "c/d"));
    EXPECT_EQ(Written([&] { (void)download.Output("/file"); }),
              "Content-Type: a/b\r\nContent-type: c/d\r\n<file>");
}

TEST_F(Download, FailsToSetAHeaderWithoutAResponse) {
    APIDownload download(nullptr);
    EXPECT_FALSE(download.SetHeader("X-One", "1"));
    EXPECT_FALSE(download.SetHeader(Parse(R"({"X-One": "1"})")));
    EXPECT_TRUE(download.SetHeader(Parse(R"({})")));
    EXPECT_TRUE(download.SetHeader(Parse(R"({"X-One": 1})")));
}

TEST_F(Download, SetsTheTextsOfAnObjectAndSkipsTheRest) {
    APIDownload download(&response);
    EXPECT_TRUE(download.SetHeader(
        Parse(R"({"A": "1", "B": 2, "C": null, "D": ["x"], "E": {"F": "g"}, "G": true, "H": "",
                  "Z": "26"})")));
    EXPECT_EQ(
        response.GetHeaders(),
        Parse(R"({"A": "1", "Content-type": "text/html; charset=\"UTF-8\"", "H": "", "Z": "26"})"));
}

TEST_F(Download, SetsNothingOutOfWhatIsNoObject) {
    APIDownload download(&response);
    const Json::Value before = response.GetHeaders();
    for (const char* headers : {"null", "{}"}) {
        EXPECT_TRUE(download.SetHeader(Parse(headers))) << headers;
    }
    // The text form answers for "text": what it says is the response's business.
    for (const char* headers : {"[]", "[\"a\"]", "1", "true"}) {
        (void)download.SetHeader(Parse(headers));
    }
    EXPECT_EQ(response.GetHeaders(), before);
}

// The empty name comes first in the order of names.
TEST_F(Download, StopsAtTheFirstHeaderThatFails) {
    APIDownload download(&response);
    EXPECT_FALSE(download.SetHeader(Parse(R"({"": "nameless", "A": "1"})")));
    EXPECT_FALSE(response.HasHeader("A"));
    EXPECT_TRUE(download.SetHeader(Parse(R"({"": 7, "A": "1"})")));
    EXPECT_TRUE(response.HasHeader("A"));
}

TEST_F(Download, FailsToSetHeadersThatTheResponseHasNoPlaceFor) {
    LoseSection("headers");
    APIDownload download(&response);
    EXPECT_FALSE(download.SetHeader("A", "1"));
    EXPECT_FALSE(download.SetHeader(Parse(R"({"A": "1"})")));
}

TEST_F(Download, PrintsTheHeaderLinesInTheOrderOfTheirNamesWithoutABlankLine) {
    APIDownload download(&response);
    for (const char* name : {"b", "A", "a", "X-2", "X-10", "Z"}) {
        EXPECT_TRUE(download.SetHeader(name, name));
    }
    const std::string lines = std::string("A: A\r\n") + kContentType +
                              "X-10: X-10\r\nX-2: X-2\r\nZ: Z\r\na: a\r\nb: b\r\n";
    EXPECT_EQ(Written([&] { (void)download.Output("/file"); }), lines + "<file>");
    EXPECT_EQ(Written([&] { (void)download.Output(stdin); }), lines + "<file>");
}

TEST_F(Download, PrintsNoHeaderThatIsNoText) {
    Put("headers", "Number", 7);
    Put("headers", "Nothing", Json::Value());
    Put("headers", "Flag", true);
    Put("headers", "Object", Parse(R"({"a": "b"})"));
    Put("headers", "Empty", "");
    APIDownload download(&response);
    EXPECT_EQ(Written([&] { (void)download.Output("/file"); }),
              std::string(kContentType) + "Empty: \r\n<file>");
}

TEST_F(Download, PrintsNothingOfItsOwnWhenThereIsNoHeader) {
    LoseSection("headers");
    EXPECT_EQ(Written([this] { (void)APIDownload(&response).Output("/file"); }), "<file>");
    EXPECT_EQ(Written([] { (void)APIDownload(nullptr).Output("/file"); }), "<file>");
}

// Status and server error are headers like all others; cookies are not.
TEST_F(Download, PrintsHeadersOnly) {
    response.SetStatus(TALO::HTTP_STATUS_NOT_FOUND, "Not Found");
    response.SetServerError("lost");
    EXPECT_TRUE(response.AddCookie("/", "a", "1"));
    EXPECT_EQ(Written([this] { (void)APIDownload(&response).Output("/file"); }),
              std::string(kContentType) + "Status: 404\r\nx-request-error: lost\r\n<file>");
}

TEST_F(Download, PassesTheTypeThatWasSet) {
    APIDownload download(&response);
    download.SetMimeType("a/b; charset=x");
    (void)Written([&] {
        (void)download.Output("/file");
        EXPECT_EQ(LastCall().mimeType, "a/b; charset=x");
        (void)download.Output(stdin);
        EXPECT_EQ(LastCall().mimeType, "a/b; charset=x");
        EXPECT_TRUE(fake::Now().mimeTypeCalls.empty());
    });
}

TEST_F(Download, TakesTheTypeFromAFileNameThatNeedsNoFile) {
    APIDownload download(&response);
    fake::Now().mimeType = "by/name";
    download.SetMimeTypeFromFileName("report.pdf");
    EXPECT_EQ(fake::Now().mimeTypeCalls, std::vector<std::string>{"report.pdf"});
    fake::Now().mimeType = "later/type";
    (void)Written([&] {
        (void)download.Output("/other.txt");
        EXPECT_EQ(LastCall().mimeType, "by/name");
        EXPECT_EQ(fake::Now().mimeTypeCalls.size(), 1u);
    });
}

TEST_F(Download, ReplacesTheTypeByTheOneSetLast) {
    APIDownload download(&response);
    download.SetMimeType("a/b");
    download.SetMimeTypeFromFileName("x");
    EXPECT_EQ(PrivateOf(download)->mimeType, "fake/type");
    download.SetMimeType("");
    EXPECT_EQ(PrivateOf(download)->mimeType, "");
}

// Required: only a path gives its type by its name.
TEST_F(Download, CountsAStreamWithoutATypeAsUnknownBytes) {
    (void)Written([this] {
        APIDownload download(&response);
        (void)download.Output(stdin);
        EXPECT_EQ(LastCall().mimeType, "application/octet-stream");
        EXPECT_EQ(PrivateOf(download)->mimeType, "application/octet-stream");
        EXPECT_TRUE(fake::Now().mimeTypeCalls.empty());
    });
}

TEST_F(Download, TakesTheTypeOfAPathWithoutOneFromItsName) {
    (void)Written([this] {
        APIDownload download(&response);
        fake::Now().mimeType = "by/path";
        (void)download.Output("/some/file.txt");
        EXPECT_EQ(LastCall().mimeType, "by/path");
        EXPECT_EQ(PrivateOf(download)->mimeType, "by/path");
        EXPECT_EQ(fake::Now().mimeTypeCalls, std::vector<std::string>{"/some/file.txt"});
    });
}

TEST_F(Download, FallsBackAlsoWhereTheNameGaveNoType) {
    (void)Written([this] {
        APIDownload download(&response);
        fake::Now().mimeType = "";
        download.SetMimeTypeFromFileName("x");
        (void)download.Output("/y");
        const std::vector<std::string> asked = {"x", "/y"};
        EXPECT_EQ(fake::Now().mimeTypeCalls, asked);
        EXPECT_EQ(LastCall().mimeType, "");
        (void)download.Output(stdin);
        EXPECT_EQ(LastCall().mimeType, "application/octet-stream");
    });
}

TEST_F(Download, HandsOverTheStreamWithoutAName) {
    (void)Written([this] {
        (void)APIDownload(&response).Output(stdin);
        ASSERT_EQ(fake::Now().outputCalls.size(), 1u);
        EXPECT_EQ(LastCall().file, stdin);
        EXPECT_EQ(LastCall().path, "");
        EXPECT_EQ(LastCall().fileName, "");
    });
}

TEST_F(Download, HandsOverThePathAsItStands) {
    (void)Written([this] {
        (void)APIDownload(&response).Output("../a b/\xC3\xA4%41.bin");
        ASSERT_EQ(fake::Now().outputCalls.size(), 1u);
        EXPECT_EQ(LastCall().file, nullptr);
        EXPECT_EQ(LastCall().path, "../a b/\xC3\xA4%41.bin");
    });
}

TEST_F(Download, AnswersWhatThePlatformAnswers) {
    for (const int result : {0, 1, 7, -1, -5, 4096}) {
        (void)Written([this, result] {
            fake::Now().outputResult = result;
            EXPECT_EQ(APIDownload(&response).Output("/file"), result);
            EXPECT_EQ(APIDownload(&response).Output(stdin), result);
        });
    }
}

TEST_F(Download, DoesNotTouchTheSwitchOfTheResponsesOutput) {
    (void)Written([this] {
        (void)APIDownload(&response).Output("/file");
        EXPECT_TRUE(response.IsEnableOutput());
        response.SetEnableOutput(false);
        (void)APIDownload(&response).Output("/file");
        EXPECT_FALSE(response.IsEnableOutput());
    });
}

TEST(DownloadLayout, IsOnePointerWithoutVirtualOperations) {
    static_assert(!std::is_polymorphic<APIDownload>::value, "");
    static_assert(!std::is_polymorphic<APIDownloadPrivate>::value, "");
    static_assert(!std::is_copy_constructible<APIDownload>::value, "");
    static_assert(!std::is_copy_assignable<APIDownload>::value, "");
    EXPECT_EQ(sizeof(APIDownload), sizeof(void*));
}

TEST(DownloadLayout, KeepsTheOrderOfItsFields) {
    const APIDownload download(nullptr);
    const APIDownloadPrivate& whole = *PrivateOf(download);
    const auto offset = [&whole](const void* field) {
        return static_cast<size_t>(static_cast<const char*>(field) -
                                   reinterpret_cast<const char*>(&whole));
    };
    static_assert(std::is_same<decltype(whole.owner), APIDownload*>::value, "");
    static_assert(std::is_same<decltype(whole.response), APIResponse*>::value, "");
    static_assert(std::is_same<decltype(whole.mimeType), std::string>::value, "");
    static_assert(std::is_same<decltype(whole.outputer), HTTPFileOutputer>::value, "");
    static_assert(std::is_same<decltype(whole.ownsResponse), bool>::value, "");
    EXPECT_EQ(offset(&whole.owner), 0u);
    EXPECT_EQ(offset(&whole.response), sizeof(void*));
    EXPECT_EQ(offset(&whole.mimeType), 2 * sizeof(void*));
    EXPECT_EQ(offset(&whole.outputer), 2 * sizeof(void*) + sizeof(std::string));
    EXPECT_EQ(offset(&whole.ownsResponse), offset(&whole.outputer) + sizeof(HTTPFileOutputer));
    EXPECT_EQ(whole.owner, &download);
    EXPECT_EQ(whole.response, nullptr);
    EXPECT_EQ(whole.mimeType, "");
    EXPECT_FALSE(whole.ownsResponse);
}

}  // namespace
