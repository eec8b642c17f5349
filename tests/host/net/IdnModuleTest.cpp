#include "hosts/linux/net/IdnModule.h"

#include <dlfcn.h>
#include <gtest/gtest.h>

#include <string>

namespace {

class IdnModule : public ::testing::Test {
  protected:
    IdnModule() : library_(dlopen(IDN_MODULE, RTLD_NOW | RTLD_LOCAL)) {
        if (library_ != nullptr) {
            module = static_cast<const TaloIdnModule*>(dlsym(library_, kIdnModuleSymbol));
        }
    }
    ~IdnModule() override {
        if (library_ != nullptr) {
            (void)dlclose(library_);
        }
    }
    void SetUp() override {
        ASSERT_NE(module, nullptr);
    }

    std::string ToAscii(const std::string& name) const {
        char ascii[256];
        return module->toAscii(name.c_str(), ascii, sizeof ascii) != 0 ? ascii : "refused";
    }

    const TaloIdnModule* module = nullptr;

  private:
    void* library_;
};

TEST_F(IdnModule, WritesNamesAsTheDnsHasThem) {
    const struct {
        const char* name;
        const char* text;
        const char* ascii;
    } rows[] = {
        {"German",
         "b\xC3\xBC"
         "cher.example",
         "xn--bcher-kva.example"},
        {"upper case",
         "B\xC3\x9C"
         "CHER.Example",
         "xn--bcher-kva.example"},
        {"decomposed",
         "bu\xCC\x88"
         "cher.example",
         "xn--bcher-kva.example"},
        {"sharp s stays itself", "fa\xC3\x9F.example", "xn--fa-hia.example"},
        {"Japanese", "\xE4\xBE\x8B\xE3\x81\x88.jp", "xn--r8jz45g.jp"},
        {"Cyrillic", "\xD1\x80\xD1\x84", "xn--p1ai"},
        {"full stop of another script",
         "b\xC3\xBC"
         "cher\xE3\x80\x82"
         "example",
         "xn--bcher-kva.example"},
        {"dot behind",
         "b\xC3\xBC"
         "cher.example.",
         "xn--bcher-kva.example."},
    };
    for (const auto& row : rows) {
        EXPECT_EQ(ToAscii(row.text), row.ascii) << row.name;
    }
}

TEST_F(IdnModule, RefusesABufferThatIsTooSmall) {
    const std::string wanted = "xn--p1ai";
    char small[9] = "kept";
    EXPECT_EQ(module->toAscii("\xD1\x80\xD1\x84", small, wanted.size()), 0);
    EXPECT_STREQ(small, "kept");
    EXPECT_EQ(module->toAscii("\xD1\x80\xD1\x84", small, wanted.size() + 1), 1);
    EXPECT_EQ(small, wanted);
}

TEST_F(IdnModule, LeavesTheBufferForWhatIsNoName) {
    char buffer[256] = "kept";
    EXPECT_EQ(module->toAscii("a\xFF", buffer, sizeof buffer), 0);
    EXPECT_STREQ(buffer, "kept");
}

}  // namespace
