#ifndef TESTS_HOST_FILE_PLACEFIXTURE_H
#define TESTS_HOST_FILE_PLACEFIXTURE_H

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "hosts/linux/sdk/Places.h"
#include "tests/support/TempFolder.h"

// A share with the folder "share", and beside it the folder "outside" with the
// file "secret" in it, which nobody may ever see.
class PlaceFixture : public ::testing::Test {
  public:
    PlaceFixture();

    std::string InShare(const std::string& path) const;
    std::string Outside(const std::string& path) const;
    void Write(const std::string& path, const std::string& content) const;
    void MakeFolders(const std::string& path) const;
    void Link(const std::string& path, const std::string& target) const;

    // Opens the place of a path in the share: "a/b".
    void At(const std::string& path, talo::Place* place) const;

    // The content read through the share, or "error N".
    std::string Read(const std::string& path) const;
    // The file's content by the system itself, "" when there is none.
    static std::string ContentOf(const std::string& path);

    // What stands in the outside folder must never change.
    void ExpectOutsideUntouched() const;

  private:
    support::TempFolder folder_;
};

// The same, once with the kernel's resolver and once with the walk.
class BothResolvers : public PlaceFixture, public ::testing::WithParamInterface<bool> {
  public:
    void SetUp() override;
    void TearDown() override;
    static bool Walks() {
        return GetParam();
    }
};

std::vector<std::string> Split(const std::string& path);

// gtest prints it.
namespace talo {
void PrintTo(FileError error, std::ostream* out);
}

#endif
