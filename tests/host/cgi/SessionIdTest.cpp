#include <json/json.h>

#include <set>
#include <string>

#include "hosts/linux/util/JsonGrammar.h"
#include "hosts/linux/util/ParameterLine.h"
#include "tests/host/cgi/SessionFixture.h"

namespace {

constexpr char kAlphabet[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_";

class SessionId : public SessionTest {};

TEST_F(SessionId, IsALetterAnd43CharactersForAUrlAndNoTwoAreTheSame) {
    std::set<std::string> ids;
    std::set<std::string> handles;
    for (int round = 0; round < 10000; ++round) {
        const std::string id = Open();
        ASSERT_EQ(id.size(), 44u);
        ASSERT_EQ(id[0], 's') << id;
        ASSERT_EQ(id.find_first_not_of(kAlphabet), std::string::npos) << id;
        ASSERT_TRUE(talo::IsSessionId(id)) << id;
        talo::Session session;
        ASSERT_TRUE(talo::FindSession(id, &session));
        ids.insert(id);
        handles.insert(session.handle);
        ASSERT_TRUE(talo::EndSession(id));
    }
    EXPECT_EQ(ids.size(), 10000u);
    EXPECT_EQ(handles.size(), 10000u);
}

TEST_F(SessionId, UsesTheWholeAlphabetAtEveryPlaceOfIts256Bits) {
    std::vector<std::set<char>> seen(44);
    for (int round = 0; round < 2000; ++round) {
        const std::string id = Open();
        for (size_t place = 0; place < id.size(); ++place) {
            seen[place].insert(id[place]);
        }
        ASSERT_TRUE(talo::EndSession(id));
    }
    EXPECT_EQ(seen[0].size(), 1u);
    for (size_t place = 1; place < 43; ++place) {
        EXPECT_EQ(seen[place].size(), 64u) << place;
    }
    // 256 bits are 42 characters of six bits and one of four.
    EXPECT_EQ(seen[43].size(), 16u);
}

TEST_F(SessionId, IsNeverTakenForJson) {
    for (int round = 0; round < 1000; ++round) {
        const std::string id = Open();
        host::JsonError error;
        EXPECT_FALSE(host::AcceptJson(id.data(), id.data() + id.size(), 64, &error)) << id;
        Json::Value parameters(Json::objectValue);
        ASSERT_TRUE(host::MergeParameterLine("_sid=" + id, parameters, true, true));
        EXPECT_EQ(parameters["_sid"], Json::Value(id));
        ASSERT_TRUE(talo::EndSession(id));
    }
}

TEST_F(SessionId, IsNotToldByItsHandle) {
    const std::string id = Open();
    talo::Session session;
    ASSERT_TRUE(talo::FindSession(id, &session));
    EXPECT_EQ(session.handle.size(), 13u);
    EXPECT_EQ(session.handle[0], 'h');
    EXPECT_EQ(session.handle.find_first_not_of(kAlphabet), std::string::npos);
    EXPECT_EQ(id.find(session.handle.substr(1)), std::string::npos);
    EXPECT_FALSE(talo::IsSessionId(session.handle));
    EXPECT_FALSE(Exists(session.handle));
}

struct NotAnId {
    const char* what;
    std::string text;
};

std::vector<NotAnId> TextsThatAreNoId() {
    const std::string rest(43, 'A');
    return {
        {"nothing", ""},
        {"one character", "s"},
        {"one character less", "s" + rest.substr(1)},
        {"one character more", "s" + rest + "A"},
        {"65,536 characters", "s" + std::string(65535, 'A')},
        {"another letter", "t" + rest},
        {"the letter in upper case", "S" + rest},
        {"no letter", "A" + rest},
        {"a slash in front", "/" + rest},
        {"a slash within", "s" + rest.substr(1) + "/"},
        {"a parent folder", "s/../" + rest.substr(4)},
        {"only dots", ".."},
        {"a dot", "s" + rest.substr(1) + "."},
        {"escaped dots", "s" + rest.substr(6) + "%2e%2e"},
        {"NUL at the end", "s" + rest.substr(1) + std::string(1, '\0')},
        {"NUL behind an id", "s" + rest + std::string(1, '\0')},
        {"NUL within", "s" + std::string(1, '\0') + rest.substr(1)},
        {"other base64", "s" + rest.substr(1) + "+"},
        {"padding", "s" + rest.substr(1) + "="},
        {"a blank", "s" + rest.substr(1) + " "},
        {"a line end", "s" + rest + "\n"},
        {"a byte above ASCII", "s" + rest.substr(1) + "\xE9"},
        {"what a session is being written as", "s" + rest + ".abcdef"},
    };
}

TEST_F(SessionId, HasOneFormOnly) {
    EXPECT_TRUE(talo::IsSessionId(UnusedId()));
    EXPECT_TRUE(talo::IsSessionId("s-_0123456789" + std::string(31, 'z')));
    for (const NotAnId& row : TextsThatAreNoId()) {
        EXPECT_FALSE(talo::IsSessionId(row.text)) << row.what;
    }
}

// A session's file under each name that can be one: only the form counts.
TEST_F(SessionId, ThatIsNoneFindsRenewsAndEndsNothing) {
    const std::string record = Read(Open());
    for (const NotAnId& row : TextsThatAreNoId()) {
        const std::string name = row.text.substr(0, row.text.find('\0'));
        const bool placed = !name.empty() && name.size() < 255 && name[0] != '.' &&
                            name.find('/') == std::string::npos && name.size() != 44;
        if (placed) {
            Write(name, record);
        }
        const auto before = Names();
        talo::Session session;
        session.user = "untouched";
        EXPECT_FALSE(talo::FindSession(row.text, &session)) << row.what;
        EXPECT_EQ(session.user, "untouched") << row.what;
        EXPECT_FALSE(talo::RenewSession(row.text)) << row.what;
        EXPECT_FALSE(talo::EndSession(row.text)) << row.what;
        EXPECT_EQ(Names(), before) << row.what;
    }
}

}  // namespace
