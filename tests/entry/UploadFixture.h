#ifndef TESTS_ENTRY_UPLOADFIXTURE_H
#define TESTS_ENTRY_UPLOADFIXTURE_H

#include <gtest/gtest.h>
#include <json/json.h>
#include <syslog.h>

#include <cstdint>
#include <memory>
#include <string>

#include "tests/fake/FakePlatform.h"
#include "tests/support/Json.h"
#include "tests/support/LogCapture.h"
#include "webapi/APIRequest.h"
#include "webapi/APIUpload.h"

// A request with a body, and a reading of it, on an appliance whose data volume
// takes everything.
class UploadFixture : public ::testing::Test {
  protected:
    UploadFixture() {
        fake::Reset();
        fake::Now().volume = "/volume1";
        fake::Now().volumeFree = UINT64_MAX;
    }
    ~UploadFixture() override {
        upload_.reset();
        request_.reset();
        fake::Reset();
    }

    TALO::APIRequest& request() {
        return *request_;
    }

    // Made when it is first used, so that a test can script the platform before.
    TALO::APIUpload& upload() {
        if (upload_ == nullptr) {
            upload_ = std::make_unique<TALO::APIUpload>(request_.get());
        }
        return *upload_;
    }

    void SetLength(const std::string& text) {
        Json::Value environ(Json::objectValue);
        environ["CONTENT_LENGTH"] = text;
        request_->InitEnv(environ);
    }

    int ReadAll() {
        return upload().GetUploadAll(params, &fileList);
    }

    static fake::UploadScript& Script() {
        return fake::Now().upload;
    }
    static const fake::UploadCall& LastCall() {
        return fake::Now().uploadCalls.back();
    }

    Json::Value params{Json::objectValue};
    Json::Value fileList{Json::arrayValue};
    const support::LogCapture log;

  private:
    std::unique_ptr<TALO::APIRequest> request_{new TALO::APIRequest(Json::Value())};
    std::unique_ptr<TALO::APIUpload> upload_;
};

#endif
