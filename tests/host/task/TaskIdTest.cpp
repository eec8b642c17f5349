#include <set>

#include "TaskRoot.h"
#include "tests/support/Json.h"

namespace {

class TaskId : public TaskRoot {
  public:
    static void Make(const std::string& user, const std::string& id) {
        ASSERT_TRUE(ORB::Task(user.c_str(), id.c_str()).isValid()) << id;
    }
    static std::string Listed(const char* prefix) {
        std::string text;
        for (const Json::Value& id : ORB::TaskMgr("anna").getAllTaskId(prefix)) {
            text += id.asString() + " ";
        }
        return text;
    }
};

TEST_F(TaskId, BeginsWithThePrefix) {
    for (const std::string& prefix :
         {std::string(), std::string("copy"), std::string("-_.09aZ"), std::string(64, 'p')}) {
        const std::string id = Id(prefix.c_str());
        EXPECT_EQ(id.compare(0, prefix.size(), prefix), 0);
        EXPECT_GT(id.size(), prefix.size());
        EXPECT_TRUE(ORB::Task("anna", id.c_str()).isValid()) << id;
    }
}

TEST_F(TaskId, IsRefusedToAPrefixThatIsNoName) {
    for (const std::string& prefix :
         {std::string("a/b"), std::string("a b"), std::string("*"), std::string("\xc3\xa9"),
          std::string(65, 'p'), std::string("a\n"), std::string("'")}) {
        EXPECT_EQ(Id(prefix.c_str()), "") << prefix;
    }
    EXPECT_EQ(ORB::TaskUtil::getUniqueID("", "copy"), "");
    EXPECT_EQ(ORB::TaskUtil::getUniqueID(nullptr, "copy"), "");
    EXPECT_EQ(ORB::TaskUtil::getUniqueID("@others", "copy"), "");
    EXPECT_TRUE(WasLogged("no task can be named"));
}

TEST_F(TaskId, TakesNullForNoPrefix) {
    EXPECT_NE(Id(nullptr), "");
}

TEST_F(TaskId, NeverReadsAsANumber) {
    for (const char* prefix : {"", "1", "-1", "1.5", "1e"}) {
        EXPECT_NE(Id(prefix).find('t'), std::string::npos);
        EXPECT_THROW(
            {
                const Json::Value parsed = support::Parse("[" + Id(prefix) + "]");
                (void)parsed;
            },
            std::exception)
            << prefix;
    }
}

TEST_F(TaskId, DiffersFromAllOthersAlsoInManyProcesses) {
    constexpr int kProcesses = 4;
    constexpr int kEach = 200;
    std::vector<pid_t> processes;
    for (int process = 0; process < kProcesses; ++process) {
        processes.push_back(StartProcess([] {
            for (int number = 0; number < kEach; ++number) {
                if (!ORB::Task("anna", Id("same").c_str()).isValid()) {
                    return 1;
                }
            }
            return 0;
        }));
    }
    for (const pid_t process : processes) {
        EXPECT_EQ(WaitFor(process), 0);
    }
    EXPECT_EQ(ORB::TaskMgr("anna").getAllTaskId("same").size(), kProcesses * kEach);
}

TEST_F(TaskId, IsListedInTheOrderOfCreation) {
    for (const char* id : {"b2", "a1", "b1", "c"}) {
        Make("anna", id);
    }
    Make("bert", "b3");
    Make("@users", "b4");
    EXPECT_EQ(Listed(nullptr), "b2 a1 b1 c ");
    EXPECT_EQ(Listed(""), "b2 a1 b1 c ");
    EXPECT_EQ(Listed("b"), "b2 b1 ");
    EXPECT_EQ(Listed("b1"), "b1 ");
    EXPECT_EQ(Listed("b12"), "");
    EXPECT_EQ(Listed("B"), "");
    EXPECT_EQ(ORB::TaskMgr("@users").getAllTaskId(nullptr), support::Parse("[\"b4\"]"));
}

TEST_F(TaskId, TakesAPrefixByItsLetters) {
    for (const char* id : {"a_b", "axb", "a.b", "a-b"}) {
        Make("anna", id);
    }
    EXPECT_EQ(Listed("a_"), "a_b ");
    EXPECT_EQ(Listed("%"), "");
    EXPECT_EQ(Listed("a*"), "");
    EXPECT_EQ(Listed("' OR 1"), "");
    EXPECT_EQ(Listed(std::string(100000, 'a').c_str()), "");
    EXPECT_EQ(Listed("a\x7f"), "");
}

TEST_F(TaskId, IsListedNowhereWhenThereAreNone) {
    const Json::Value none(Json::arrayValue);
    EXPECT_EQ(ORB::TaskMgr("anna").getAllTaskId(nullptr), none);
    EXPECT_EQ(ORB::TaskMgr("").getAllTaskId(nullptr), none);
    EXPECT_TRUE(ORB::TaskMgr("anna").isValid());
    EXPECT_FALSE(ORB::TaskMgr("").isValid());
}

}  // namespace
