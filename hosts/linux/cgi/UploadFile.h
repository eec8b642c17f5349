#ifndef TALO_HOSTS_LINUX_CGI_UPLOADFILE_H
#define TALO_HOSTS_LINUX_CGI_UPLOADFILE_H

#include <cstddef>
#include <memory>
#include <string>

namespace host {

// A file with a name of our own that receives one part of a body; removed at the
// end of its life unless it is kept. Mode 0600, whatever the umask.
class UploadFile {
  public:
    // Makes one in a folder. Null on failure with errno set.
    static std::unique_ptr<UploadFile> Create(const std::string& dir);

    ~UploadFile();
    UploadFile(const UploadFile&) = delete;
    UploadFile& operator=(const UploadFile&) = delete;

    // Both are false on failure with errno set.
    bool Write(const char* data, size_t size);
    bool Close();

    // The file stays, and is its receiver's to remove.
    void Keep() {
        kept_ = true;
    }
    const std::string& Path() const {
        return path_;
    }
    unsigned long long Size() const {
        return size_;
    }

  private:
    UploadFile(const std::string& path, int file) : path_(path), file_(file) {}

    const std::string path_;
    int file_;
    unsigned long long size_ = 0;
    bool kept_ = false;
};

}  // namespace host

#endif
