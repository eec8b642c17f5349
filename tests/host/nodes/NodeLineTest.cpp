#include "hosts/linux/relay/NodeLine.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>

#include "hosts/linux/util/LineObject.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

constexpr char kPin[] = "sha256//47DEQpj8HBSa+/TImW+5JCeuQeRkm5NMpJWZG3hSuFU=";
constexpr char kHash[] = "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855";

bool Parse(const std::string& line, talo::Node* node, std::string* why = nullptr) {
    std::string reason;
    const bool understood =
        host::ParseNodeLine(line.data(), line.data() + line.size(), node, nullptr, &reason);
    EXPECT_NE(understood, !reason.empty()) << line;
    if (why != nullptr) {
        *why = reason;
    }
    return understood;
}

std::string Called(const std::string& more = "") {
    return R"({"id":2,"url":"https://nas2.local/","self":1,"secret":"shown")" + more + "}";
}

std::string Accepts(const std::string& hash, const std::string& classes) {
    return R"("accepts":{"secret_hash":)" + hash + R"(,"classes":)" + classes + "}";
}

std::string Calling(const std::string& hash, const std::string& classes) {
    return R"({"id":2,)" + Accepts(hash, classes) + "}";
}

std::string Quoted(const std::string& text) {
    return "\"" + text + "\"";
}

TEST(NodeLine, ReadsEveryMember) {
    talo::Node node;
    ASSERT_TRUE(Parse(R"({"id": 9223372036854775807, "url": "https://nas2.local:5001/entry.cgi",)"
                      R"( "authority": "/etc/talo/nas2 \u00e4.pem", "pin": ")" +
                          std::string(kPin) + R"(", "self": 7, "secret": "shown", )" +
                          Accepts(Quoted(kHash), R"(["normal.local", "admin.ldap"])") + "}",
                      &node));
    EXPECT_EQ(9223372036854775807, node.id);
    EXPECT_EQ("https://nas2.local:5001/entry.cgi", node.url);
    EXPECT_EQ("/etc/talo/nas2 \xC3\xA4.pem", node.authority);
    EXPECT_EQ(kPin, node.pin);
    EXPECT_EQ(7, node.self);
    EXPECT_EQ("shown", node.secret);
    EXPECT_EQ(kHash, node.secretHash);
    EXPECT_THAT(node.classes, ElementsAre("normal.local", "admin.ldap"));
}

TEST(NodeLine, MayHaveEitherHalfAlone) {
    talo::Node called;
    ASSERT_TRUE(Parse(Called(), &called));
    EXPECT_EQ("", called.authority + called.pin + called.secretHash);
    EXPECT_THAT(called.classes, IsEmpty());
    talo::Node calling;
    ASSERT_TRUE(Parse(Calling(Quoted(kHash), R"(["normal.local"])"), &calling));
    EXPECT_EQ("", calling.url + calling.secret + calling.authority + calling.pin);
    EXPECT_EQ(0, calling.self);
}

TEST(NodeLine, GrantsEachClassOfUsersAndNone) {
    talo::Node node;
    ASSERT_TRUE(Parse(Calling(Quoted(kHash), R"(["admin.local","admin.domain","admin.ldap",)"
                                             R"("normal.local","normal.domain","normal.ldap"])"),
                      &node));
    EXPECT_EQ(6u, node.classes.size());
    ASSERT_TRUE(Parse(Calling(Quoted(kHash), "[]"), &node));
    EXPECT_THAT(node.classes, IsEmpty());
}

TEST(NodeLine, RefusesOneWrongMemberWhole) {
    const std::string members[] = {
        R"("id":0)",
        R"("id":-2)",
        R"("id":2.0)",
        R"("id":2e0)",
        R"("id":"2")",
        R"("id":null)",
        R"("id":[2])",
        R"("id":true)",
        R"("id":9223372036854775808)",
        R"("id":18446744073709551615)",
        R"("self":0)",
        R"("self":-1)",
        R"("self":1.0)",
        R"("self":"1")",
        R"("self":null)",
        R"("url":"")",
        R"("url":"http://nas2.local/")",
        R"("url":"https://anna@nas2.local/")",
        R"("url":"https://nas2.local/\u0000")",
        R"("url":7)",
        R"("url":null)",
        R"("url":["https://nas2.local/"])",
        R"("authority":"")",
        R"("authority":"nas2.pem")",
        R"("authority":"../nas2.pem")",
        R"("authority":"/a\u0000")",
        R"("authority":"/a\nb")",
        R"("authority":"/a\u001b[31m")",
        R"("authority":"/a\u0085")",
        R"("authority":7)",
        R"("authority":null)",
        R"("authority":"/)" + std::string(4095, 'a') + R"(")",
        R"("pin":"")",
        R"("pin":7)",
        R"("pin":null)",
        R"("secret":"")",
        R"("secret":"a b")",
        R"("secret":"a\n")",
        R"("secret":"a\u0000")",
        R"("secret":"\u00e4")",
        R"("secret":")" + std::string(257, 'a') + R"(")",
        R"("secret":7)",
        R"("secret":null)",
        R"("accepts":null)",
        R"("accepts":[])",
        R"("accepts":{})",
        R"("accepts":true)",
        R"("accepts":"normal.local")",
        R"("accepts":{"classes":["normal.local"]})",
        R"("accepts":{"secret_hash":")" + std::string(kHash) + R"("})",
        Accepts("null", "[]"),
        Accepts("7", "[]"),
        Accepts(R"("")", "[]"),
        Accepts(Quoted(std::string(63, 'a')), "[]"),
        Accepts(Quoted(std::string(65, 'a')), "[]"),
        Accepts(Quoted(std::string(64, 'A')), "[]"),
        Accepts(Quoted(std::string(64, 'g')), "[]"),
        Accepts(Quoted(kHash), "null"),
        Accepts(Quoted(kHash), R"("normal.local")"),
        Accepts(Quoted(kHash), R"({"normal.local":true})"),
        Accepts(Quoted(kHash), R"([7])"),
        Accepts(Quoted(kHash), R"([null])"),
        Accepts(Quoted(kHash), R"([""])"),
        Accepts(Quoted(kHash), R"(["*"])"),
        Accepts(Quoted(kHash), R"(["normal"])"),
        Accepts(Quoted(kHash), R"(["normal."])"),
        Accepts(Quoted(kHash), R"(["Normal.local"])"),
        Accepts(Quoted(kHash), R"(["normal.local "])"),
        Accepts(Quoted(kHash), R"(["normal.local\u0000"])"),
        Accepts(Quoted(kHash), R"(["normal.local","normal.local"])"),
    };
    for (const std::string& member : members) {
        talo::Node node;
        node.secret = "untouched";
        // Of two members with one name the later one counts.
        EXPECT_FALSE(Parse(Called("," + member), &node)) << member.substr(0, 100);
        EXPECT_EQ(0, node.id);
        EXPECT_EQ("untouched", node.secret);
    }
}

TEST(NodeLine, TakesTextsOfTheGreatestLength) {
    talo::Node node;
    EXPECT_TRUE(Parse(Called(R"(,"secret":")" + std::string(256, '~') + R"(")"), &node));
    EXPECT_TRUE(Parse(Called(R"(,"authority":"/)" + std::string(4094, 'a') + R"(")"), &node));
    EXPECT_EQ(4095u, node.authority.size());
}

TEST(NodePin, IsTheBase64OfThirtyTwoBytes) {
    const std::string digits = std::string(kPin).substr(8, 43);
    EXPECT_TRUE(host::IsNodePin(kPin));
    EXPECT_TRUE(host::IsNodePin("sha256//" + std::string(43, 'A') + "="));
    const std::string refused[] = {
        "",
        digits,
        "sha256//",
        "sha256/" + digits + "=",
        "SHA256//" + digits + "=",
        "sha1//" + digits + "=",
        "sha256//" + digits,
        "sha256//" + digits + "==",
        "sha256//" + digits + "A=",
        "sha256//" + digits.substr(1) + "=",
        "sha256//-" + digits.substr(1) + "=",
        "sha256//_" + digits.substr(1) + "=",
        "sha256//=" + digits.substr(1) + "=",
        "sha256//" + digits.substr(0, 42) + "V=",
        "sha256//" + digits.substr(0, 42) + "\n=",
        std::string(kPin) + ";" + kPin,
        std::string(kPin) + "\n",
    };
    for (const std::string& pin : refused) {
        EXPECT_FALSE(host::IsNodePin(pin)) << pin;
    }
}

TEST(NodeLine, RefusesHalfOfAHalf) {
    const std::string url = R"("url":"https://nas2.local/")";
    const std::string self = R"("self":1)";
    const std::string secret = R"("secret":"shown")";
    const std::string accepts = Accepts(Quoted(kHash), "[]");
    const std::string lines[] = {
        url,
        self,
        secret,
        url + "," + self,
        url + "," + secret,
        self + "," + secret,
        url + "," + accepts,
        self + "," + accepts,
        secret + "," + accepts,
        R"("pin":")" + std::string(kPin) + R"(",)" + accepts,
        R"("authority":"/a",)" + accepts,
    };
    for (const std::string& members : lines) {
        talo::Node node;
        std::string why;
        EXPECT_FALSE(Parse(R"({"id":2,)" + members + "}", &node, &why)) << members;
        EXPECT_NE(std::string::npos, why.find(" go ")) << why;
    }
    talo::Node node;
    EXPECT_FALSE(Parse(R"({"id":2})", &node));
}

TEST(NodeLine, RefusesWhatIsNotOneStrictObject) {
    const std::string lines[] = {"x",
                                 "{",
                                 "{}",
                                 "[]",
                                 "2",
                                 "null",
                                 R"({"url":"https://nas2.local/","self":1,"secret":"shown"})",
                                 "[" + Called() + "]",
                                 Called() + "}",
                                 Called() + Called(),
                                 Called(","),
                                 "// comment",
                                 Called() + "// comment",
                                 "{'id':2}",
                                 Called() + std::string(1, '\0'),
                                 std::string(100000, '['),
                                 Called(R"(,"x":)" + std::string(20, '[') + std::string(20, ']'))};
    for (const std::string& line : lines) {
        talo::Node node;
        EXPECT_FALSE(Parse(line, &node)) << line.substr(0, 60);
    }
}

TEST(NodeLine, SaysWhichMemberIsWrong) {
    talo::Node node;
    std::string why;
    EXPECT_FALSE(Parse(Called(R"(,"pin":"x")"), &node, &why));
    EXPECT_EQ("\"pin\" is not valid", why);
    EXPECT_FALSE(Parse("{}", &node, &why));
    EXPECT_EQ("\"id\" is missing", why);
}

TEST(NodeLine, KeepsMembersThatItDoesNotKnow) {
    const std::string line = Called(R"(,"place":{"room":[1,2.5,"\u00e4"]})");
    talo::Node node;
    Json::Value members;
    std::string reason;
    ASSERT_TRUE(
        host::ParseNodeLine(line.data(), line.data() + line.size(), &node, &members, &reason));
    node.url = "https://other.local/";
    node.pin = kPin;
    node.secretHash = kHash;
    node.classes = {"admin.local"};
    host::SetNodeMembers(node, &members);
    EXPECT_EQ("{\"accepts\":{\"classes\":[\"admin.local\"],\"secret_hash\":\"" +
                  std::string(kHash) + "\"},\"id\":2,\"pin\":\"" + kPin +
                  "\",\"place\":{\"room\":[1,2.5,\"\xC3\xA4\"]},\"secret\":\"shown\",\"self\":1,"
                  "\"url\":\"https://other.local/\"}",
              host::RenderLineObject(members));
}

TEST(NodeLine, LeavesNothingOfAHalfThatIsTakenAway) {
    const std::string line =
        Called("," + Accepts(Quoted(kHash), R"(["normal.local"])") + R"(,"authority":"/a")");
    talo::Node node;
    Json::Value members;
    std::string reason;
    ASSERT_TRUE(
        host::ParseNodeLine(line.data(), line.data() + line.size(), &node, &members, &reason));
    talo::Node nothing;
    nothing.id = 2;
    host::SetNodeMembers(nothing, &members);
    EXPECT_EQ("{\"id\":2}", host::RenderLineObject(members));
}

TEST(NodeSecret, IsOfVisibleAscii) {
    for (const std::string& text : {std::string("a"), std::string("!~"), std::string(256, 'x')}) {
        EXPECT_TRUE(host::IsNodeSecret(text)) << text;
    }
    for (const std::string& text :
         {std::string(), std::string(" "), std::string("a b"), std::string("a\n"),
          std::string("\x7f"), std::string("\xC3\xA4"), std::string(1, '\0'),
          std::string(257, 'x')}) {
        EXPECT_FALSE(host::IsNodeSecret(text)) << text;
    }
}

}  // namespace
