#ifndef TESTS_HOST_SLICE_SLICEFIXTURE_H
#define TESTS_HOST_SLICE_SLICEFIXTURE_H

#include <gtest/gtest.h>

#include <ostream>
#include <string>
#include <vector>

#include "hosts/linux/sdk/Slices.h"

// Standard input is a file with that content as long as it lives. The content may
// be empty, and is not changed by who reads it.
class Input {
  public:
    explicit Input(const std::string& content);
    ~Input();
    Input(const Input&) = delete;
    Input& operator=(const Input&) = delete;

    // How much has been read of it.
    size_t Taken() const;

  private:
    int before_;
};

// Uploads in a folder of the test's own in memory, since a disk would be asked to
// write each slice down. Gone at the end, and with it the configuration.
class SliceTest : public ::testing::Test {
  protected:
    SliceTest();
    ~SliceTest() override;

    // The host's configuration besides the folder.
    void Configure(const std::string& lines) const;
    // Another place for the uploads.
    void Place(const std::string& folder);
    // What checksums need is there, or not.
    void LendDigests();
    void TakeDigestsAway();

    // Begins mia's upload of that many bytes and answers its id, "" on failure.
    static std::string Begin(unsigned long long length, const std::string& digest = "");
    static talo::SliceResult Create(const std::string& owner, unsigned long long length,
                                    std::string* id = nullptr);

    // Sends a slice; promises as many bytes as there are, or other ones.
    static talo::SliceResult Send(const std::string& id, unsigned long long offset,
                                  const std::string& content, const std::string& digest = "",
                                  const std::string& owner = "mia");
    static talo::SliceResult SendPart(const std::string& id, unsigned long long offset,
                                      const std::string& content, unsigned long long promised,
                                      const std::string& digest = "");

    // -1 when the upload is not found.
    static long long OffsetOf(const std::string& id, const std::string& owner = "mia");
    static bool Exists(const std::string& id, const std::string& owner = "mia");

    // Where mia's files are, and what is in them.
    std::string FolderPath() const;
    std::string PathOf(const std::string& name) const;
    std::string DataPathOf(const std::string& id) const;
    std::vector<std::string> Names() const;
    static std::string Read(const std::string& path);
    static void Write(const std::string& path, const std::string& content);

    // Makes the last use of record and data, or of any file, that many seconds ago.
    void LeaveUnused(const std::string& id, long long seconds) const;
    static void Age(const std::string& path, long long seconds);
    // The last sweep was long ago.
    void MakeSweepDue() const;

    static size_t OpenDescriptors();

  private:
    std::string folder_;
    std::string place_;
    bool lent_;
    bool away_;
};

// Bytes that differ from one place to the next.
std::string Content(size_t size);

// How results show in a failed expectation.
namespace talo {
void PrintTo(SliceResult result, std::ostream* out);
}

// An id's form with no upload behind it.
std::string UnusedSliceId();

#endif
