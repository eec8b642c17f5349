#include <filesystem>
#include <fstream>

#include "platform/Paths.h"
#include "tests/host/relay/RelayFixture.h"

// In an executable of its own: a module that is loaded stays.
namespace {

namespace fs = std::filesystem;
using talo::RelayError;

bool IsMapped(const std::string& library) {
    std::ifstream maps("/proc/self/maps");
    for (std::string line; std::getline(maps, line);) {
        if (line.find(library) != std::string::npos) {
            return true;
        }
    }
    return false;
}

class RelayModule : public RelayTest {};

TEST_F(RelayModule, IsLoadedByTheFirstCallAndWaitedForUntilThen) {
    const fs::path module = fs::path(TALO_MODULE_DIR) / "talo-relay.so";
    fs::remove(module);
    EXPECT_EQ(Call().error, Number(RelayError::kUnavailable));
    EXPECT_EQ(talo::TestNode(2, "anna"), RelayError::kUnavailable);
    EXPECT_TRUE(WasLogged("no appliance can be called"));
    EXPECT_FALSE(IsMapped("libcurl"));
    EXPECT_FALSE(IsMapped("libssl"));
    fs::copy_file(RELAY_MODULE, module);
    EXPECT_EQ(Call().error, 0);
    EXPECT_TRUE(IsMapped("libcurl"));
}

}  // namespace
