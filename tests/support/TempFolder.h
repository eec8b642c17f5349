#ifndef TESTS_SUPPORT_TEMPFOLDER_H
#define TESTS_SUPPORT_TEMPFOLDER_H

#include <stdlib.h>

#include <filesystem>
#include <fstream>
#include <string>

namespace support {

// A folder of the test's own, removed with all that is in it.
class TempFolder {
  public:
    TempFolder() {
        char name[] = "/tmp/webapi-test-XXXXXX";
        path_ = mkdtemp(name);
    }
    ~TempFolder() {
        std::error_code ignored;
        std::filesystem::remove_all(path_, ignored);
    }
    TempFolder(const TempFolder&) = delete;
    TempFolder& operator=(const TempFolder&) = delete;

    std::string Path(const std::string& name) const {
        return path_ + "/" + name;
    }

    // Writes a file and answers its path.
    std::string Write(const std::string& name, const std::string& content) const {
        std::ofstream(Path(name), std::ios::binary) << content;
        return Path(name);
    }

  private:
    std::string path_;
};

}  // namespace support

#endif
