#include <errno.h>

#include <string>

#include "platform/System.h"
#include "tests/contract/World.h"

namespace {

class SystemFacility : public Contract {};

TEST_F(SystemFacility, KnowsWhichFilesExist) {
    const std::string path = world->PathOf("file");
    EXPECT_EQ(TLIBCFileExist(path.c_str()), 0);
    world->WriteFile(path, "");
    EXPECT_EQ(TLIBCFileExist(path.c_str()), 1);
}

TEST_F(SystemFacility, DeletesAFileOnce) {
    const std::string path = world->PathOf("file");
    world->WriteFile(path, "content");
    EXPECT_EQ(TLIBCSysUnlink(path.c_str()), 0);
    EXPECT_EQ(TLIBCFileExist(path.c_str()), 0);
    errno = 0;
    EXPECT_EQ(TLIBCSysUnlink(path.c_str()), -1);
    EXPECT_EQ(errno, ENOENT);
}

TEST_F(SystemFacility, TellsAnAdministratorFromAStranger) {
    EXPECT_EQ(TLIBGroupIsAdminGroupMem(world->Administrator().c_str(), 0), 1);
    EXPECT_EQ(TLIBGroupIsAdminGroupMem(world->Stranger().c_str(), 0), 0);
    EXPECT_EQ(TLIBGroupIsAdminGroupMem("", 0), 0);
}

TEST_F(SystemFacility, AnswersPreferenceFoldersThatFit) {
    const struct {
        std::string folder;
        int (*get)(const char* name, char* buffer, size_t size);
    } rows[] = {
        {world->MakeUserPreference("contract"), TALOUserPreferenceDirGet},
        {world->MakeGroupPreference("contract"), TALOGroupPreferenceDirGet},
    };
    for (const auto& row : rows) {
        char buffer[1024] = "untouched";
        EXPECT_LT(row.get("contract", buffer, row.folder.size()), 0);
        EXPECT_LT(row.get("nobody-has-that", buffer, sizeof buffer), 0);
        EXPECT_LT(row.get("..", buffer, sizeof buffer), 0);
        EXPECT_STREQ(buffer, "untouched");
        EXPECT_EQ(row.get("contract", buffer, row.folder.size() + 1), 0);
        EXPECT_EQ(buffer, row.folder);
    }
}

}  // namespace
