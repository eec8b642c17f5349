#include <dlfcn.h>
#include <gtest/gtest.h>

#include <filesystem>
#include <string>

#include "hosts/linux/net/IdnModule.h"
#include "platform/Paths.h"
#include "platform/System.h"
#include "tests/support/Child.h"

namespace fs = std::filesystem;

namespace {

const char kBooks[] =
    "b\xC3\xBC"
    "cher.example";

bool IsLoaded(const char* library) {
    void* handle = dlopen(library, RTLD_NOW | RTLD_NOLOAD);
    if (handle != nullptr) {
        (void)dlclose(handle);
    }
    return handle != nullptr;
}

// The module in its place; whatever was there comes back. It stays in a process that
// has used it, so names are tested in children.
class InternationalName : public ::testing::Test {
  protected:
    InternationalName() : place_(std::string(TALO_MODULE_DIR) + kIdnModuleFile) {
        fs::create_directories(TALO_MODULE_DIR);
        if (fs::exists(fs::symlink_status(place_))) {
            fs::rename(place_, Away());
        }
        fs::create_symlink(IDN_MODULE, place_);
    }
    ~InternationalName() override {
        std::error_code ignored;
        fs::remove(place_, ignored);
        if (fs::exists(fs::symlink_status(Away()))) {
            fs::rename(Away(), place_, ignored);
        }
    }

    void TakeModuleAway() const {
        fs::remove(place_);
    }
    void PutModuleBack() const {
        fs::create_symlink(IDN_MODULE, place_);
    }

  private:
    std::string Away() const {
        return place_ + ".away";
    }
    const std::string place_;
};

std::string Times(size_t count, const std::string& text) {
    std::string all;
    for (size_t index = 0; index < count; ++index) {
        all += text;
    }
    return all;
}

TEST_F(InternationalName, IsTestedAsTheDnsHasIt) {
    const struct {
        const char* name;
        std::string text;
        bool isDomain;
        bool isHost;
    } rows[] = {
        {"German", kBooks, true, true},
        {"one label", "m\xC3\xBCller", true, true},
        {"upper case",
         "B\xC3\x9C"
         "CHER.EXAMPLE",
         true, true},
        {"decomposed",
         "bu\xCC\x88"
         "cher.example",
         true, true},
        {"Japanese", "\xE4\xBE\x8B\xE3\x81\x88.jp", true, true},
        {"Arabic", "\xD9\x85\xD8\xAB\xD8\xA7\xD9\x84", true, true},
        {"beside an encoded label",
         "xn--p1ai.b\xC3\xBC"
         "cher",
         true, true},
        {"dot behind", std::string(kBooks) + ".", true, false},
        {"full stop of another script behind", std::string(kBooks) + "\xE3\x80\x82", true, false},
        {"two dots behind", std::string(kBooks) + "..", false, false},
        {"empty label",
         "b\xC3\xBC"
         "cher..example",
         false, false},
        {"full stop of another script alone", "\xE3\x80\x82", false, false},
        {"underscore",
         "b\xC3\xBC"
         "cher_a.example",
         false, false},
        {"blank",
         "b\xC3\xBC"
         "cher a.example",
         false, false},
        {"end of line",
         "b\xC3\xBC"
         "cher.example\n",
         false, false},
        {"hyphen in front",
         "-b\xC3\xBC"
         "cher.example",
         false, false},
        {"hyphen behind",
         "b\xC3\xBC"
         "cher-.example",
         false, false},
        {"hyphen in front of an ASCII label",
         "b\xC3\xBC"
         "cher.-example",
         false, false},
        {"numeric last label",
         "b\xC3\xBC"
         "cher.1",
         false, false},
        {"address in wide digits", "\xEF\xBC\x91\xEF\xBC\x90.0.0.1", false, false},
        {"number in wide digits", "\xEF\xBC\x91\xEF\xBC\x90", false, false},
        {"slash behind a wide one",
         "a\xEF\xBC\x8F"
         "b",
         false, false},
        {"accent without a letter",
         "\xCC\x88"
         "a",
         false, false},
        {"soft hyphen alone", "\xC2\xAD", false, false},
        {"private use", "a\xEE\x80\x80", false, false},

        {"a byte alone", "a\xFF", false, false},
        {"follower alone",
         "a\x80"
         "b",
         false, false},
        {"cut at the end", "b\xC3", false, false},
        {"cut inside",
         "b\xC3"
         "cher",
         false, false},
        {"overlong dot",
         "a\xC0\xAE"
         "b",
         false, false},
        {"overlong NUL",
         "a\xC0\x80"
         "b",
         false, false},
        {"surrogate", "a\xED\xA0\x80", false, false},
        {"above Unicode", "a\xF4\x90\x80\x80", false, false},

        // "xn--", and "-kva" behind what is ASCII of the label.
        {"label of 63", "\xC3\xBC" + std::string(54, 'a') + ".org", true, true},
        {"label too long", "\xC3\xBC" + std::string(63, 'a') + ".org", false, false},
        {"ASCII label too long", "\xC3\xBC." + std::string(64, 'a'), false, false},
        // "ü" is "xn--tda".
        {"253 in all", Times(31, "\xC3\xBC.") + "abcde", true, true},
        {"254 in all", Times(31, "\xC3\xBC.") + "abcdef", false, false},
        {"253 and a dot", Times(31, "\xC3\xBC.") + "abcde.", true, false},
        {"254 and a dot", Times(31, "\xC3\xBC.") + "abcdef.", false, false},
        {"very long", Times(50000, "\xC3\xBC."), false, false},
        {"very long label", Times(50000, "\xC3\xBC"), false, false},
        {"very long, invisible", "a" + Times(50000, "\xC2\xAD"), false, false},
    };
    const support::ChildResult result = support::InChild([&rows] {
        for (const auto& row : rows) {
            EXPECT_EQ(BlTLIBIsDomain(row.text.c_str()) != 0, row.isDomain) << row.name;
            EXPECT_EQ(BlTLIBIsHostname(row.text.c_str()) != 0, row.isHost) << row.name;
        }
        return 0;
    });
    EXPECT_EQ(result.status, 0);
}

TEST_F(InternationalName, AloneLoadsTheLibrary) {
    const support::ChildResult result = support::InChild([] {
        EXPECT_NE(BlTLIBIsDomain("example.org"), 0);
        EXPECT_NE(BlTLIBIsHostname("xn--p1ai"), 0);
        EXPECT_EQ(BlTLIBIsHostname("a_b"), 0);
        EXPECT_EQ(TALONetGetAddrType("::1"), 10);
        // Neither does what is no UTF-8 or too long.
        EXPECT_EQ(BlTLIBIsDomain("a\xFF"), 0);
        EXPECT_EQ(BlTLIBIsDomain(Times(1000, "\xC3\xBC").c_str()), 0);
        EXPECT_FALSE(IsLoaded("libidn2.so.0"));
        EXPECT_NE(BlTLIBIsDomain(kBooks), 0);
        EXPECT_TRUE(IsLoaded("libidn2.so.0"));
        return 0;
    });
    EXPECT_EQ(result.status, 0);
}

TEST_F(InternationalName, IsRefusedWhileTheModuleIsMissing) {
    const support::ChildResult result = support::InChild([this] {
        TakeModuleAway();
        EXPECT_EQ(BlTLIBIsDomain(kBooks), 0);
        EXPECT_EQ(BlTLIBIsHostname(kBooks), 0);
        EXPECT_NE(BlTLIBIsDomain("example.org"), 0);
        PutModuleBack();
        EXPECT_NE(BlTLIBIsDomain(kBooks), 0);
        EXPECT_NE(BlTLIBIsHostname(kBooks), 0);
        return 0;
    });
    EXPECT_EQ(result.status, 0);
}

}  // namespace
