#include <stdlib.h>
#include <unistd.h>

#include <fstream>
#include <stdexcept>

#include "tests/fake/FakePlatform.h"
#include "tests/runner/RunnerFixture.h"

namespace {

using runner::Description;
using runner::Parse;

// Which file holds an API. Every file describes the API under its own name in
// "lib", so that a test sees which one was read.
class DescriptionFile : public runner::Fixture {
  protected:
    void Write(const std::string& file, const std::string& api) {
        Json::Value content(Json::objectValue);
        content[api] = Description();
        content[api]["lib"] = file;
        Describe(file, content);
    }

    // The file that an API was loaded from, "" when none was.
    std::string Source(const std::string& api) {
        Json::Value descs(Json::objectValue);
        if (!Runner().InitLibDesc(descs, api)) {
            EXPECT_TRUE(descs.empty());
            return "";
        }
        return descs.isMember(api) ? descs[api]["lib"].asString() : "";
    }

    Json::Value descs = Json::Value(Json::objectValue);
};

TEST_F(DescriptionFile, RefusesTheEmptyNameWithoutAWord) {
    Describe(".lib", Parse(R"({"": {}})"));
    EXPECT_EQ(Runner().InitLibDesc(descs, ""), 0);
    EXPECT_EQ(fake::Now().calls["TLIBCFileExist"], 0);
    EXPECT_TRUE(log.Lines().empty());
}

TEST_F(DescriptionFile, IsNotLookedForWhenTheDescriptionIsThere) {
    descs["A.B"] = "anything";
    EXPECT_EQ(Runner().InitLibDesc(descs, "A.B"), 1);
    EXPECT_EQ(descs, Parse(R"({"A.B": "anything"})"));
    EXPECT_EQ(fake::Now().calls["TLIBCFileExist"], 0);
}

TEST_F(DescriptionFile, IsReadOnlyOncePerRunner) {
    Write("A.B.lib", "A.B");
    (void)Runner();
    const int before = fake::Now().calls["ReadJsonFile"];
    EXPECT_EQ(Runner().InitLibDesc(Runner().libDesc, "A.B"), 1);
    EXPECT_EQ(Runner().InitLibDesc(Runner().libDesc, "A.B"), 1);
    EXPECT_EQ(fake::Now().calls["ReadJsonFile"], before + 1);
}

struct CandidateCase {
    const char* name;
    const char* api;
    const char* file;
    bool found;
};

const CandidateCase kCandidates[] = {
    {"NoDot", "A", "A.lib", true},
    {"OneDot", "A.B", "A.B.lib", true},
    {"OneDotNotItsFirstComponent", "A.B", "A.lib", false},
    {"TwoDotsFirstPrefix", "A.B.C", "A.B.lib", true},
    {"TwoDotsWholeName", "A.B.C", "A.B.C.lib", true},
    {"ThreeDotsFirstPrefix", "A.B.C.D", "A.B.lib", true},
    {"ThreeDotsSecondPrefix", "A.B.C.D", "A.B.C.lib", true},
    {"ThreeDotsWholeName", "A.B.C.D", "A.B.C.D.lib", true},
    {"FiveComponentsWholeName", "A.B.C.D.E", "A.B.C.D.E.lib", true},
    {"SixComponentsBeforeTheFifthDot", "A.B.C.D.E.F", "A.B.C.D.E.lib", true},
    {"SixComponentsNeverTheWholeName", "A.B.C.D.E.F", "A.B.C.D.E.F.lib", false},
    {"SevenComponentsBeforeTheFifthDot", "A.B.C.D.E.F.G", "A.B.C.D.E.lib", true},
    {"SevenComponentsNotBeforeTheSixth", "A.B.C.D.E.F.G", "A.B.C.D.E.F.lib", false},
    {"NoPartOfAComponent", "A.BC", "A.B.lib", false},
    {"NotWithoutItsEnding", "A.B", "A.B", false},
    {"LettersDigitsDotUnderscoreDash", "a9.Z_z-0", "a9.Z_z-0.lib", true},
    {"BeginsWithADigit", "9.B", "9.B.lib", true},
    {"EmptyComponent", "A..B", "A..lib", true},
    {"EndsWithADot", "A.", "A..lib", true},
};

TEST_F(DescriptionFile, IsOneOfTheFirstFourPrefixesOrTheWholeName) {
    for (const CandidateCase& row : kCandidates) {
        fake::Now().files.clear();
        Write(row.file, row.api);
        EXPECT_EQ(Source(row.api), row.found ? row.file : "") << row.name;
    }
}

TEST_F(DescriptionFile, IsTheLongestPrefixThatExists) {
    Write("A.B.lib", "A.B.C.D");
    Write("A.B.C.lib", "A.B.C.D");
    EXPECT_EQ(Source("A.B.C.D"), "A.B.C.lib");
    Write("A.B.C.D.lib", "A.B.C.D");
    EXPECT_EQ(Source("A.B.C.D"), "A.B.C.D.lib");
}

TEST_F(DescriptionFile, AsksForEveryCandidateAndNoMoreThanFour) {
    const std::pair<const char*, int> questions[] = {
        {"A", 1}, {"A.B", 1}, {"A.B.C", 2}, {"A.B.C.D", 3}, {"A.B.C.D.E", 4}, {"A.B.C.D.E.F", 4}};
    for (const auto& [api, count] : questions) {
        fake::Now().calls.clear();
        EXPECT_EQ(Source(api), "");
        EXPECT_EQ(fake::Now().calls["TLIBCFileExist"], count) << api;
    }
}

TEST_F(DescriptionFile, OfANameThatFitsNoneIsLoggedAndRefused) {
    EXPECT_EQ(Runner().InitLibDesc(descs, "A.B.C"), 0);
    EXPECT_TRUE(Logged("WebAPI A.B.C is not valid"));
    EXPECT_EQ(log.Lines().back().priority, LOG_ERR);
    EXPECT_TRUE(descs.empty());
}

TEST_F(DescriptionFile, ThatCannotBeReadIsLoggedAndRefused) {
    Describe("A.B.lib", std::string("{\"A.B\": "));
    EXPECT_EQ(Runner().InitLibDesc(descs, "A.B.C"), 0);
    EXPECT_TRUE(Logged("WebAPI description file A.B.lib is not valid"));
    EXPECT_TRUE(descs.empty());
}

TEST_F(DescriptionFile, GivesAllItsValidAPIsAndLogsTheOthers) {
    Json::Value content(Json::objectValue);
    content["A.B.First"] = Description();
    content["A.B.Broken"] = Parse(R"({"lib": 5})");
    content["Other"] = Description();
    Describe("A.B.lib", content);
    EXPECT_EQ(Runner().InitLibDesc(descs, "A.B.First"), 1);
    EXPECT_EQ(descs.getMemberNames(), std::vector<std::string>({"A.B.First", "Other"}));
    EXPECT_TRUE(Logged("WebAPI description A.B.Broken is not valid."));
    EXPECT_EQ(log.Lines().size(), 1u);
}

TEST_F(DescriptionFile, CountsAsFoundEvenWithoutTheAPI) {
    Write("A.B.lib", "A.B.Other");
    EXPECT_EQ(Runner().InitLibDesc(descs, "A.B.Asked"), 1);
    EXPECT_EQ(descs.getMemberNames(), std::vector<std::string>({"A.B.Other"}));
}

TEST_F(DescriptionFile, FillsDefaultsIntoWhatItGives) {
    Write("A.B.lib", "A.B");
    ASSERT_EQ(Runner().InitLibDesc(descs, "A.B"), 1);
    EXPECT_EQ(descs["A.B"]["authLevel"], Json::Value(1));
    EXPECT_EQ(descs["A.B"]["requestFormat"], Json::Value("JSON"));
}

TEST_F(DescriptionFile, AddsToWhatIsThere) {
    descs["Known"] = 1;
    Write("A.B.lib", "A.B");
    ASSERT_EQ(Runner().InitLibDesc(descs, "A.B"), 1);
    EXPECT_EQ(descs.getMemberNames(), std::vector<std::string>({"A.B", "Known"}));
}

TEST_F(DescriptionFile, IsFoundByTheNameOfTheRequest) {
    Write("A.B.lib", "A.B");
    TALO::APIRequest request(Post("A.B", 1, "ok"));
    EXPECT_EQ(Runner().InitLibDesc(descs, &request), 1);
    EXPECT_TRUE(descs.isMember("A.B"));
    EXPECT_EQ(Runner().InitLibDesc(descs, static_cast<TALO::APIRequest*>(nullptr)), 0);
}

TEST_F(DescriptionFile, IsNeverLookedForUnderANameThatIsNoAPIName) {
    const std::string names[] = {"../../etc/x",
                                 "/etc/x",
                                 "A/B",
                                 ".A",
                                 "-A",
                                 "_A",
                                 "A B",
                                 "A\nB",
                                 "A.B;",
                                 "*",
                                 "\xc3\xa4.B",
                                 "A.B%2e",
                                 "A\\B",
                                 "..",
                                 ".",
                                 std::string("A\0B", 3),
                                 std::string("A.B\0", 4),
                                 "A.B\x7f"};
    for (const std::string& name : names) {
        Write(name + ".lib", name);
        EXPECT_EQ(Runner().InitLibDesc(descs, name), 0) << name;
    }
    EXPECT_EQ(fake::Now().calls["TLIBCFileExist"], 0);
    EXPECT_TRUE(descs.empty());
    EXPECT_TRUE(Logged("WebAPI ../../etc/x is not valid"));
    EXPECT_TRUE(Logged("WebAPI A\\x0aB is not valid"));
}

TEST_F(DescriptionFile, CannotSmuggleInANameThatIsNoAPIName) {
    Write("A.B.lib", "A.B/../x");
    ASSERT_EQ(Runner().InitLibDesc(descs, "A.B"), 1);
    EXPECT_EQ(Runner().InitLibDesc(descs, "A.B/../x"), 0);
}

// The platform's files are fake, the folder's listing is real.
class AllDescriptionFiles : public DescriptionFile {
  protected:
    void SetUp() override {
        ASSERT_NE(mkdtemp(folder), nullptr);
    }
    void TearDown() override {
        for (const std::string& file : touched) {
            (void)unlink((folder + ("/" + file)).c_str());
        }
        EXPECT_EQ(rmdir(folder), 0);
    }

    void Touch(const std::string& file) {
        std::ofstream(folder + ("/" + file)).put('\n');
        touched.push_back(file);
    }

    // The names loaded in that folder, or "none" when the operation failed.
    void ExpectLoaded(const std::vector<std::string>& names, int result) {
        runner::InChild([&] {
            ASSERT_EQ(chdir(folder), 0);
            EXPECT_EQ(Runner().InitLibDesc(descs), result);
            EXPECT_EQ(descs.getMemberNames(), names);
        });
    }

    char folder[32] = "/tmp/descriptions-XXXXXX";
    std::vector<std::string> touched;
};

TEST_F(AllDescriptionFiles, FailInAFolderWithoutAny) {
    Touch("A.B.txt");
    ExpectLoaded({}, 0);
}

TEST_F(AllDescriptionFiles, OfTheWorkingDirectoryAreLoaded) {
    for (const char* name : {"A.B", "C"}) {
        Touch(name + std::string(".lib"));
        Write(name + std::string(".lib"), name);
    }
    Write("Elsewhere.lib", "Elsewhere");
    ExpectLoaded({"A.B", "C"}, 1);
}

TEST_F(AllDescriptionFiles, GiveNothingWhereTheyCannotBeRead) {
    Touch("Bad.lib");
    Touch("List.lib");
    Touch("Good.lib");
    Describe("Bad.lib", std::string("{"));
    Describe("List.lib", std::string("[1, 2]"));
    Write("Good.lib", "Good");
    ExpectLoaded({"Good"}, 1);
}

TEST_F(AllDescriptionFiles, SkipInvalidMembersAndFillDefaults) {
    Touch("A.lib");
    Json::Value content(Json::objectValue);
    content["Bad"] = 1;
    content["Good"] = Description();
    Describe("A.lib", content);
    runner::InChild([&] {
        ASSERT_EQ(chdir(folder), 0);
        EXPECT_EQ(Runner().InitLibDesc(descs), 1);
        EXPECT_EQ(descs.getMemberNames(), std::vector<std::string>({"Good"}));
        EXPECT_EQ(descs["Good"]["requestFormat"], Json::Value("JSON"));
        EXPECT_TRUE(Logged("WebAPI description Bad is not valid."));
    });
}

TEST_F(AllDescriptionFiles, AreVisitedOneAfterTheOther) {
    Touch("A.lib");
    Touch("B.lib");
    Json::Value content(Json::objectValue);
    content["Bad"] = 1;
    content["First"] = Description();
    content["Twice"] = Description();
    Describe("A.lib", content);
    Write("B.lib", "Twice");
    runner::InChild([&] {
        ASSERT_EQ(chdir(folder), 0);
        std::vector<std::string> names;
        const auto visit = [&](const std::string& name, Json::Value& description) {
            EXPECT_EQ(description["requestFormat"], Json::Value("JSON"));
            Json::Value taken;
            taken.swap(description);
            names.push_back(name);
        };
        for (int round = 0; round < 2; ++round) {
            names.clear();
            EXPECT_EQ(Runner().VisitLibDesc(visit), 1);
            EXPECT_EQ(names, std::vector<std::string>({"First", "Twice", "Twice"}));
        }
    });
}

TEST_F(AllDescriptionFiles, AreNotVisitedWhereThereAreNone) {
    runner::InChild([&] {
        ASSERT_EQ(chdir(folder), 0);
        EXPECT_EQ(Runner().VisitLibDesc(
                      [](const std::string& name, Json::Value&) { ADD_FAILURE() << name; }),
                  0);
    });
}

TEST_F(AllDescriptionFiles, LetAVisitorThrow) {
    Touch("A.lib");
    Write("A.lib", "A");
    runner::InChild([&] {
        ASSERT_EQ(chdir(folder), 0);
        EXPECT_THROW((void)Runner().VisitLibDesc([](const std::string&, Json::Value&) {
            throw std::runtime_error("enough");
        }),
                     std::runtime_error);
    });
}

}  // namespace
