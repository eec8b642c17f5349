#include <gtest/gtest.h>

#include <iterator>
#include <string>

#include "webapi/APIValidator.h"

using TALO::APIValidator;

namespace {

typedef bool (*TextTest)(const std::string& value);

const std::string kDigits = "0123456789";
const std::string kLetters = "abcdefghijklmnopqrstuvwxyzABCDEFGHIJKLMNOPQRSTUVWXYZ";

// One place in a text of a kind, and every byte that may stand there.
struct PlaceRow {
    const char* name;
    TextTest test;
    std::string before;
    std::string after;
    std::string allowed;
};

const PlaceRow kPlaces[] = {
    {"reach net id", APIValidator::IsReachNetId, "", "", kLetters + kDigits + "-"},
    {"reach net id, behind", APIValidator::IsReachNetId, "a1-", "", kLetters + kDigits + "-"},
    {"digit", APIValidator::IsDigit, "", "", kDigits},
    {"digit, inside", APIValidator::IsDigit, "1", "2", kDigits},
    {"NetBIOS name, first", APIValidator::IsNetbios, "", "", kLetters},
    {"NetBIOS name, first of two", APIValidator::IsNetbios, "", "a", kLetters},
    {"NetBIOS name, second", APIValidator::IsNetbios, "a", "", kLetters + kDigits + "_-"},
    // The range from "+" to the backslash holds all of these in ASCII's order.
    {"mail, local part", APIValidator::IsEMail, "", "@example.org",
     kLetters + kDigits + "+,-./:;<=>?@[\\" + "!#$%&'*^_`{|}~\"()"},
    {"mail, inside the local part", APIValidator::IsEMail, "a", "b@example.org",
     kLetters + kDigits + "+,-./:;<=>?@[\\" + "!#$%&'*^_`{|}~\"()"},
    {"mail, domain", APIValidator::IsEMail, "me@", "",
     kLetters + kDigits + "+,-./:;<=>?@[\\" + "_&%!#"},
    {"mail, inside the domain", APIValidator::IsEMail, "me@a", "b",
     kLetters + kDigits + "+,-./:;<=>?@[\\" + "_&%!#"},
    {"mail, the sign", APIValidator::IsEMail, "me", "example.org", "@"},
};

TEST(Pattern, AllowsInEachPlaceExactlyItsCharacters) {
    for (const PlaceRow& row : kPlaces) {
        for (int code = 1; code < 256; ++code) {
            const char byte = static_cast<char>(code);
            const bool allowed = row.allowed.find(byte) != std::string::npos;
            EXPECT_EQ(row.test(row.before + byte + row.after), allowed) << row.name << " " << code;
        }
    }
}

TEST(IsWorkGroup, WantsOneCharacterThatIsNotReserved) {
    const std::string reserved = "][;:\"<>*+\\/|?,";
    for (int code = 1; code < 256; ++code) {
        const char byte = static_cast<char>(code);
        const bool passes = reserved.find(byte) == std::string::npos;
        EXPECT_EQ(APIValidator::IsWorkGroup(std::string(1, byte)), passes) << code;
        EXPECT_EQ(APIValidator::IsWorkGroup(std::string(3, byte)), passes) << code;
        EXPECT_EQ(APIValidator::IsWorkGroup(reserved + byte), passes) << code;
        EXPECT_EQ(APIValidator::IsWorkGroup(byte + reserved), passes) << code;
        EXPECT_TRUE(APIValidator::IsWorkGroup(std::string("a") + byte)) << code;
    }
}

struct TextRow {
    const char* name;
    TextTest test;
    std::string value;
    bool passes;
};

const TextRow kTexts[] = {
    {"reach net id, empty", APIValidator::IsReachNetId, "", false},
    {"reach net id", APIValidator::IsReachNetId, "My-Box-01", true},
    {"reach net id, hyphens only", APIValidator::IsReachNetId, "--", true},
    {"reach net id, long", APIValidator::IsReachNetId, std::string(5000, 'a'), true},
    {"reach net id, dot", APIValidator::IsReachNetId, "my.box", false},
    {"reach net id, end of line behind", APIValidator::IsReachNetId, "box\n", false},
    {"reach net id, second line", APIValidator::IsReachNetId, "box\nbox", false},
    {"reach net id, UTF-8", APIValidator::IsReachNetId, "b\xC3\xB6x", false},

    {"digit, empty", APIValidator::IsDigit, "", false},
    {"digit, one", APIValidator::IsDigit, "0", true},
    {"digit, many", APIValidator::IsDigit, std::string(5000, '9'), true},
    {"digit, sign", APIValidator::IsDigit, "-1", false},
    {"digit, plus", APIValidator::IsDigit, "+1", false},
    {"digit, point", APIValidator::IsDigit, "1.0", false},
    {"digit, blank in front", APIValidator::IsDigit, " 1", false},
    {"digit, end of line behind", APIValidator::IsDigit, "1\n", false},
    {"digit, hexadecimal", APIValidator::IsDigit, "0x1", false},
    {"digit, of another script", APIValidator::IsDigit, "\xD9\xA1", false},

    {"work group, empty", APIValidator::IsWorkGroup, "", false},
    {"work group", APIValidator::IsWorkGroup, "WORKGROUP", true},
    {"work group, some reserved", APIValidator::IsWorkGroup, "a;b", true},
    {"work group, one semicolon", APIValidator::IsWorkGroup, ";", false},
    {"work group, semicolons", APIValidator::IsWorkGroup, ";;;", false},
    {"work group, all reserved", APIValidator::IsWorkGroup, "][;:\"<>*+\\/|?,", false},
    {"work group, blank", APIValidator::IsWorkGroup, " ", true},
    {"work group, end of line", APIValidator::IsWorkGroup, "\n", true},
    {"work group, a caret", APIValidator::IsWorkGroup, "^", true},
    {"work group, UTF-8", APIValidator::IsWorkGroup, "\xC3\xB6", true},
    {"work group, long and reserved", APIValidator::IsWorkGroup, std::string(5000, '*'), false},
    {"work group, long, last one free", APIValidator::IsWorkGroup, std::string(5000, '*') + "a",
     true},

    {"NetBIOS name, empty", APIValidator::IsNetbios, "", false},
    {"NetBIOS name, one letter", APIValidator::IsNetbios, "a", true},
    {"NetBIOS name", APIValidator::IsNetbios, "Disk_Station-01", true},
    {"NetBIOS name, 254 characters", APIValidator::IsNetbios, std::string(254, 'a'), true},
    {"NetBIOS name, 255 characters", APIValidator::IsNetbios, std::string(255, 'a'), true},
    {"NetBIOS name, 256 characters", APIValidator::IsNetbios, std::string(256, 'a'), false},
    {"NetBIOS name, digit in front", APIValidator::IsNetbios, "1box", false},
    {"NetBIOS name, hyphen in front", APIValidator::IsNetbios, "-box", false},
    {"NetBIOS name, line in front", APIValidator::IsNetbios, "_box", false},
    {"NetBIOS name, dot", APIValidator::IsNetbios, "box.local", false},
    {"NetBIOS name, end of line behind", APIValidator::IsNetbios, "box\n", false},
    {"NetBIOS name, UTF-8", APIValidator::IsNetbios, "b\xC3\xB6x", false},

    {"mail, empty", APIValidator::IsEMail, "", false},
    {"mail", APIValidator::IsEMail, "me@example.org", true},
    {"mail, dots and plus", APIValidator::IsEMail, "first.last+tag@mail.example.org", true},
    {"mail, shortest", APIValidator::IsEMail, "a@b", true},
    {"mail, no sign", APIValidator::IsEMail, "example.org", false},
    {"mail, sign only", APIValidator::IsEMail, "@", false},
    {"mail, no local part", APIValidator::IsEMail, "@example.org", false},
    {"mail, no domain", APIValidator::IsEMail, "me@", false},
    {"mail, two signs", APIValidator::IsEMail, "me@you@example.org", true},
    {"mail, three signs and nothing else", APIValidator::IsEMail, "@@@", true},
    {"mail, quoted", APIValidator::IsEMail, "\"me,too\"@example.org", true},
    {"mail, backslash", APIValidator::IsEMail, "me\\too@example.org", true},
    {"mail, quote in the domain", APIValidator::IsEMail, "me@\"example.org", false},
    {"mail, tilde in the domain", APIValidator::IsEMail, "me@~example.org", false},
    {"mail, blank", APIValidator::IsEMail, "me too@example.org", false},
    {"mail, closing bracket", APIValidator::IsEMail, "me@[10.0.0.1]", false},
    {"mail, end of line behind", APIValidator::IsEMail, "me@example.org\n", false},
    {"mail, header behind", APIValidator::IsEMail, "me@example.org\r\nBcc:you@example.org", false},
    {"mail, UTF-8", APIValidator::IsEMail, "m\xC3\xA9@example.org", false},
    {"mail, long", APIValidator::IsEMail, std::string(2000, 'a') + "@" + std::string(2000, 'b'),
     true},
};

TEST(Pattern, JudgesWholeTexts) {
    for (const TextRow& row : kTexts) {
        EXPECT_EQ(row.test(row.value), row.passes) << row.name;
    }
}

// What stands behind a NUL could not be looked at.
TEST(Pattern, RefusesANul) {
    const TextTest tests[] = {APIValidator::IsReachNetId, APIValidator::IsDigit,
                              APIValidator::IsWorkGroup, APIValidator::IsNetbios,
                              APIValidator::IsEMail};
    const char* const good[] = {"box", "12", "GROUP", "box", "me@example.org"};
    for (size_t index = 0; index < std::size(tests); ++index) {
        const std::string value = good[index];
        EXPECT_TRUE(tests[index](value)) << value;
        EXPECT_FALSE(tests[index](value + '\0')) << value;
        EXPECT_FALSE(tests[index](value + '\0' + value)) << value;
        EXPECT_FALSE(tests[index]('\0' + value)) << value;
        EXPECT_FALSE(tests[index](std::string(1, '\0'))) << value;
    }
}

}  // namespace
