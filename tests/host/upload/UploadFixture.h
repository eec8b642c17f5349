#ifndef TESTS_HOST_UPLOAD_UPLOADFIXTURE_H
#define TESTS_HOST_UPLOAD_UPLOADFIXTURE_H

#include <gtest/gtest.h>

#include <functional>
#include <map>
#include <string>
#include <vector>

#include "platform/Cgi.h"
#include "platform/System.h"
#include "tests/support/TempFolder.h"

// A multipart body, written part by part.
class Body {
  public:
    Body& Field(const std::string& name, const std::string& text);
    Body& File(const std::string& name, const std::string& fileName, const std::string& content);
    Body& Raw(const std::string& bytes);
    // With the last boundary line.
    std::string Whole() const;
    // Without it.
    const std::string& Open() const {
        return text_;
    }

  private:
    std::string text_;
};

using Texts = std::map<std::string, std::string>;

// Uploads in a process of their own, as the reader of a body is.
class UploadTest : public ::testing::Test {
  protected:
    UploadTest();
    ~UploadTest() override;

    // Runs `steps` in a child with the body in a pipe on standard input, written in
    // pieces of that size. Expectations in it count.
    void Serve(const std::string& body, const std::function<void()>& steps, size_t piece = 65536);

    // What the environment says of the body, when it is not the truth.
    void SayLength(const std::string& text) {
        length_ = text;
    }
    void SayType(const std::string& text) {
        type_ = text;
    }
    // Writes the host's configuration.
    static void Configure(const std::string& lines);

    std::string Dir() const {
        return folder_.Path("up");
    }
    // Names of the uploads in the folder.
    std::vector<std::string> Left() const;

  private:
    const support::TempFolder folder_;
    std::string length_;
    std::string type_ = "multipart/form-data; boundary=B";
};

// What the operations told, from within Serve's steps.
Texts Entries(const TALOSZHASH* hash);
std::string Content(const std::string& path);

struct All {
    int result;
    Texts params;
    Texts files;
};
All LoadAll(const std::string& dir);

// One reader part by part, with the framework's buffers.
class PartReader {
  public:
    PartReader();
    ~PartReader();
    PartReader(const PartReader&) = delete;
    PartReader& operator=(const PartReader&) = delete;

    int Params();
    int File(const std::string& dir);
    Texts Hash() const {
        return Entries(ctx_.paramHash);
    }

    TALOCGIUPLOAD upload = {};
    TALOCGIPROGRESS progress = nullptr;
    char fileName[256] = "";
    char fieldName[64] = "";
    char fieldValue[491] = "";

  private:
    TALOCGI ctx_ = {};
};

struct First {
    int result;
    Texts fields;
    unsigned long long total;
    unsigned long long consumed;
    std::string name;
};
First LoadFirst(int count);

#endif
