#include "src/runner/DescriptionCache.h"

#include <time.h>

#include <functional>
#include <map>

#include "src/base/FileIdentity.h"
#include "tests/fake/FakePlatform.h"
#include "tests/runner/RunnerFixture.h"

namespace {

using runner::Parse;
using TALO::FileIdentity;
using TALO::Keep;

constexpr std::int64_t kSecond = 1000000000;

std::map<std::string, FileIdentity> disk;

bool IsOnThatDisk(const char* path, FileIdentity* identity) {
    const auto file = disk.find(path);
    if (file == disk.end()) {
        return false;
    }
    *identity = file->second;
    return true;
}

std::int64_t Now() {
    struct timespec now = {};
    (void)clock_gettime(CLOCK_REALTIME, &now);
    return now.tv_sec * kSecond + now.tv_nsec;
}

// Files whose contents the fake platform has, and whose identities are written here.
class DescriptionCache : public runner::Fixture {
  protected:
    DescriptionCache() : before_(TALO::SetFileIdentifier(IsOnThatDisk)) {}
    // What is on no disk any more is forgotten when it is asked for.
    ~DescriptionCache() override {
        disk.clear();
        for (const std::string& path : seen_) {
            Json::Value ignored;
            (void)TALO::ReadDescriptionFile(ignored, path.c_str(), Keep::kAtOnce);
        }
        TALO::SetFileIdentifier(before_);
    }

    void Write(const std::string& path, const std::string& json, std::int64_t age = 60 * kSecond) {
        static std::uint64_t inode = 0;
        Describe(path, json);
        const std::int64_t time = Now() - age;
        disk[path] = {1, ++inode, static_cast<std::int64_t>(json.size()), time, time};
        seen_.push_back(path);
    }

    static Json::Value Read(const std::string& path, Keep keep = Keep::kAtOnce) {
        Json::Value content = "untouched";
        const bool read = TALO::ReadDescriptionFile(content, path.c_str(), keep);
        EXPECT_EQ(read, content != Json::Value("untouched"));
        return content;
    }

    // How often the platform was asked to read a file meanwhile.
    static int Reads(const std::function<void()>& steps) {
        const int reads = fake::Now().calls["ReadJsonFile"];
        steps();
        return fake::Now().calls["ReadJsonFile"] - reads;
    }

  private:
    TALO::FileIdentifier before_;
    std::vector<std::string> seen_;
};

TEST_F(DescriptionCache, ReadsAFileOnceThatIsToBeKeptAtOnce) {
    Write("a.lib", R"({"a": 1})");
    EXPECT_EQ(Reads([] {
                  for (int round = 0; round < 3; ++round) {
                      EXPECT_EQ(Read("a.lib"), Parse(R"({"a": 1})"));
                  }
              }),
              1);
}

TEST_F(DescriptionCache, KeepsAFileOfTheOtherKindWhenItIsReadAgain) {
    Write("a.lib", R"({"a": 1})");
    for (const int reads : {1, 1, 0, 0}) {
        EXPECT_EQ(
            Reads([] { EXPECT_EQ(Read("a.lib", Keep::kWhenReadAgain), Parse(R"({"a": 1})")); }),
            reads);
    }
}

TEST_F(DescriptionCache, ReadsEachTimeWhatIsOnNoDisk) {
    Describe("memory.lib", std::string("{}"));
    EXPECT_EQ(Reads([] {
                  (void)Read("memory.lib");
                  (void)Read("memory.lib");
                  (void)Read("memory.lib");
              }),
              3);
}

struct ChangeCase {
    const char* name;
    void (*change)(FileIdentity*);
};

const ChangeCase kChanges[] = {
    {"AnotherDevice", [](FileIdentity* file) { ++file->device; }},
    {"AnotherFile", [](FileIdentity* file) { ++file->inode; }},
    {"AnotherSize", [](FileIdentity* file) { ++file->size; }},
    {"AnotherTime", [](FileIdentity* file) { ++file->modified; }},
    {"ItsTimeSetBack", [](FileIdentity* file) { ++file->changed; }},
};

TEST_F(DescriptionCache, NoticesEveryChange) {
    for (const ChangeCase& row : kChanges) {
        Write("a.lib", R"({"a": "old"})");
        (void)Read("a.lib");
        Describe("a.lib", std::string(R"({"a": "new"})"));
        EXPECT_EQ(Read("a.lib"), Parse(R"({"a": "old"})")) << row.name;
        row.change(&disk["a.lib"]);
        EXPECT_EQ(Read("a.lib"), Parse(R"({"a": "new"})")) << row.name;
    }
}

TEST_F(DescriptionCache, DoesNotKeepWhatChangedAMomentAgo) {
    for (const std::int64_t age : {std::int64_t{0}, kSecond, -5 * kSecond}) {
        Write("young.lib", "{}", age);
        EXPECT_EQ(Reads([] {
                      (void)Read("young.lib");
                      (void)Read("young.lib");
                  }),
                  2)
            << age;
    }
}

TEST_F(DescriptionCache, DoesNotKeepWhatOnlyClaimsToBeOld) {
    Write("a.lib", "{}");
    disk["a.lib"].changed = Now();
    EXPECT_EQ(Reads([] {
                  (void)Read("a.lib");
                  (void)Read("a.lib");
              }),
              2);
}

TEST_F(DescriptionCache, DoesNotKeepWhatChangesWhileItIsRead) {
    Write("a.lib", "{}");
    TALO::SetFileIdentifier([](const char* path, FileIdentity* identity) {
        disk["a.lib"].inode++;
        return IsOnThatDisk(path, identity);
    });
    (void)Read("a.lib");
    TALO::SetFileIdentifier(IsOnThatDisk);
    EXPECT_EQ(Reads([] { (void)Read("a.lib"); }), 1);
}

TEST_F(DescriptionCache, KeepsNoRefusal) {
    Write("a.lib", "{");
    EXPECT_EQ(Reads([] {
                  EXPECT_EQ(Read("a.lib"), Json::Value("untouched"));
                  EXPECT_EQ(Read("a.lib"), Json::Value("untouched"));
              }),
              2);
    Describe("a.lib", std::string("{}"));
    EXPECT_EQ(Read("a.lib"), Parse("{}"));
}

TEST_F(DescriptionCache, ForgetsAFileThatIsGone) {
    Write("a.lib", "{}");
    (void)Read("a.lib");
    const FileIdentity identity = disk["a.lib"];
    disk.clear();
    fake::Now().files.erase("a.lib");
    EXPECT_EQ(Read("a.lib"), Json::Value("untouched"));
    disk["a.lib"] = identity;
    EXPECT_EQ(Read("a.lib"), Json::Value("untouched"));
}

TEST_F(DescriptionCache, GivesEachOneACopy) {
    Write("a.lib", R"({"a": {"b": 1}})");
    Json::Value first = Read("a.lib");
    first["a"]["b"] = 2;
    Json::Value second = Read("a.lib");
    EXPECT_EQ(second["a"]["b"], Json::Value(1));
    second.clear();
    EXPECT_EQ(Read("a.lib")["a"]["b"], Json::Value(1));
}

TEST_F(DescriptionCache, KeepsAsManyBytesAsItMay) {
    for (const char* name : {"1.lib", "2.lib", "3.lib"}) {
        Write(name, "{}");
        disk[name].size = TALO::kMostBytesKept / 2;
        (void)Read(name);
    }
    EXPECT_EQ(Reads([] { (void)Read("1.lib"), (void)Read("2.lib"); }), 0);
    EXPECT_EQ(Reads([] { (void)Read("3.lib"); }), 1);
    disk.erase("1.lib");
    (void)Read("1.lib");
    EXPECT_EQ(Reads([] { (void)Read("3.lib"), (void)Read("3.lib"); }), 1) << "there is room now";
}

TEST_F(DescriptionCache, KeepsAsManyFilesAsItMay) {
    for (int number = 0; number <= TALO::kMostFilesKept; ++number) {
        const std::string name = std::to_string(number) + ".lib";
        Write(name, "{}");
        (void)Read(name);
    }
    EXPECT_EQ(Reads([] { (void)Read("0.lib"); }), 0);
    EXPECT_EQ(Reads([] { (void)Read(std::to_string(TALO::kMostFilesKept) + ".lib"); }), 1);
}

TEST_F(DescriptionCache, ServesARunnerAfterTheOther) {
    Json::Value content(Json::objectValue);
    content["A.B"] = runner::Description();
    Write("A.B.lib", content.toStyledString());
    for (const int reads : {1, 1, 0, 0}) {
        runner::OpenRunner runner;
        EXPECT_EQ(Reads([&runner] { EXPECT_EQ(runner.InitLibDesc(runner.libDesc, "A.B"), 1); }),
                  reads);
        EXPECT_EQ(runner.libDesc["A.B"]["authLevel"], Json::Value(1)) << "defaults as ever";
        runner.libDesc["A.B"] = "spoiled";
    }
}

TEST_F(DescriptionCache, LogsWhatIsInvalidInAKeptFileEachTime) {
    Write("A.B.lib", R"({"A.B": {"lib": 5}})");
    for (int round = 1; round <= 4; ++round) {
        runner::OpenRunner runner;
        EXPECT_EQ(runner.InitLibDesc(runner.libDesc, "A.B"), 1);
        EXPECT_EQ(log.Lines().size(), static_cast<size_t>(round));
    }
    EXPECT_TRUE(Logged("WebAPI description A.B is not valid."));
}

}  // namespace
