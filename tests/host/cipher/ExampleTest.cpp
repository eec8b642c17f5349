#include <fstream>
#include <iterator>
#include <map>

#include "hosts/linux/cipher/Base64Url.h"
#include "hosts/linux/cipher/TokenText.h"
#include "tests/host/cipher/Vectors.h"

namespace {

// The worked example of the documentation: "name = value" lines.
class DocumentedExample : public ::testing::Test {
  protected:
    DocumentedExample() {
        std::ifstream file(EXAMPLE_DOCUMENT);
        bool within = false;
        for (std::string line; std::getline(file, line);) {
            const size_t equals = line.find(" = ");
            if (line.compare(0, 3, "```") == 0) {
                within = line == "```example";
            } else if (within && equals != std::string::npos) {
                values_[line.substr(0, equals)] = line.substr(equals + 3);
            }
        }
    }

    std::string Is(const std::string& name) const {
        const auto found = values_.find(name);
        EXPECT_NE(found, values_.end()) << name;
        return found != values_.end() ? found->second : "";
    }

    std::map<std::string, std::string> values_;
};

TEST_F(DocumentedExample, OfATokenIsWhatTheHostComputes) {
    std::string key;
    std::string text;
    EXPECT_EQ(Is("text's nonce"), Hex(CountUp(0xb0, 12)));
    ASSERT_TRUE(host::DeriveKeyText(taloCipherModule, Is("token"), &key));
    EXPECT_EQ(key, Is("key text"));
    ASSERT_TRUE(host::EncipherText(taloCipherModule, key, SecretOf<12>(0xb0), Is("line"), &text));
    EXPECT_EQ(text, Is("enciphered text"));
}

TEST_F(DocumentedExample, OfASealedLineIsWhatTheHostComputes) {
    const host::LineKey appliance = KeyOf(0x00);
    EXPECT_EQ(Is("appliance's secret"), Hex(appliance.secret.Text()));
    EXPECT_EQ(Is("key"), host::ToBase64Url(appliance.half.Text()));
    EXPECT_EQ(Is("key_id"), host::ToBase64Url(host::KeyIdOf(appliance.half)));

    const host::LineKey sender = KeyOf(0x20);
    EXPECT_EQ(Is("sender's secret"), Hex(sender.secret.Text()));
    EXPECT_EQ(Is("sender's public half"), Hex(sender.half.Text()));
    host::Key shared;
    ASSERT_EQ(taloCipherModule.agree(sender.secret.bytes, appliance.half.bytes, shared.bytes), 1);
    EXPECT_EQ(Is("shared secret"), Hex(shared.Text()));
    const std::string salt = sender.half.Text() + appliance.half.Text();
    host::Secret<44> cipher;
    ASSERT_EQ(taloCipherModule.derive(shared.View(), host::View(salt), host::View("talo-line-1"),
                                      cipher.bytes, 44),
              1);
    EXPECT_EQ(Is("line's key and nonce"), Hex(cipher.Text()));

    EXPECT_EQ(Is("line's nonce"), Hex(CountUp(0x40, 16)));
    host::LineContent content;
    content.time = std::stoll("0" + Is("time"));
    content.nonce = SecretOf<16>(0x40);
    content.line = Is("line");
    std::string text;
    ASSERT_TRUE(host::SealLine(taloCipherModule, appliance.half, sender.secret, content, &text));
    EXPECT_EQ(text, Is("sealed line"));
}

}  // namespace
