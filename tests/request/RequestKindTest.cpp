#include <gtest/gtest.h>

#include <memory>

#include "tests/support/Json.h"
#include "webapi/APIRequest.h"

using support::Parse;
using TALO::APIRequest;

namespace {

APIRequest* WithEnviron(const char* environ) {
    Json::Value document;
    document["environ"] = Parse(environ);
    return new APIRequest(document);
}

struct UploadRow {
    const char* name;
    const char* environ;
    bool upload;
    bool slice;
};

const UploadRow kUploads[] = {
    {"nothing", "{}", false, false},
    {"form", R"({"CONTENT_TYPE": "application/x-www-form-urlencoded"})", false, false},
    {"empty type", R"({"CONTENT_TYPE": ""})", false, false},
    {"multipart", R"({"CONTENT_TYPE": "multipart/form-data"})", true, false},
    {"multipart with a boundary", R"({"CONTENT_TYPE": "multipart/form-data; boundary=x"})", true,
     false},
    {"multipart in the middle", R"({"CONTENT_TYPE": "x; multipart/form-data; y"})", true, false},
    {"multipart in other case", R"({"CONTENT_TYPE": "Multipart/Form-Data; boundary=x"})", false,
     false},
    {"another multipart", R"({"CONTENT_TYPE": "multipart/mixed"})", false, false},
    {"slice", R"({"HTTP_X_TYPE_NAME": "SLICEUPLOAD"})", true, true},
    {"slice in lower case", R"({"HTTP_X_TYPE_NAME": "sliceupload"})", true, true},
    {"slice in mixed case", R"({"HTTP_X_TYPE_NAME": "SliceUpload"})", true, true},
    {"longer than a slice", R"({"HTTP_X_TYPE_NAME": "SLICEUPLOADS"})", false, false},
    {"shorter than a slice", R"({"HTTP_X_TYPE_NAME": "SLICEUPLOA"})", false, false},
    {"blank before a slice", R"({"HTTP_X_TYPE_NAME": " SLICEUPLOAD"})", false, false},
    {"empty slice", R"({"HTTP_X_TYPE_NAME": ""})", false, false},
    {"slice of another name", R"({"X_TYPE_NAME": "SLICEUPLOAD"})", false, false},
    {"multipart in other case as a slice",
     R"({"CONTENT_TYPE": "MULTIPART/FORM-DATA", "HTTP_X_TYPE_NAME": "sliceUpload"})", true, true},
    {"multipart as a slice",
     R"({"CONTENT_TYPE": "multipart/form-data", "HTTP_X_TYPE_NAME": "SLICEUPLOAD"})", true, true},
};

TEST(RequestKind, TellsUploads) {
    for (const UploadRow& row : kUploads) {
        SCOPED_TRACE(row.name);
        const std::unique_ptr<APIRequest> request(WithEnviron(row.environ));
        EXPECT_EQ(request->IsUploadRequest(), row.upload);
        EXPECT_EQ(request->IsSliceUploadRequest(), row.slice);
    }
}

TEST(RequestKind, IgnoresParametersThatLookLikeAnUpload) {
    const APIRequest request(Parse(R"({"getParam": {"CONTENT_TYPE": "multipart/form-data",
        "HTTP_X_TYPE_NAME": "SLICEUPLOAD", "task_id": "1", "task_user": "mia"}})"));
    EXPECT_FALSE(request.IsUploadRequest());
    EXPECT_FALSE(request.IsPollingTask());
}

struct TaskRow {
    const char* name;
    const char* environ;
    bool task;
    const char* id;
};

const TaskRow kTasks[] = {
    {"nothing", "{}", false, ""},
    {"only an id", R"({"task_id": "7"})", false, ""},
    {"only a user", R"({"task_user": "mia"})", false, ""},
    {"both", R"({"task_id": "7", "task_user": "mia"})", true, ""},
    {"both empty", R"({"task_id": "", "task_user": ""})", true, ""},
    {"a number is not kept", R"({"task_id": 7, "task_user": "mia"})", false, ""},
    {"full", R"({"task_id": "7", "task_user": "mia", "full_task_id": "@mia/7"})", true, "@mia/7"},
    {"only the full id", R"({"full_task_id": "@mia/7"})", false, "@mia/7"},
};

TEST(RequestKind, TellsBackgroundTasks) {
    for (const TaskRow& row : kTasks) {
        SCOPED_TRACE(row.name);
        const std::unique_ptr<APIRequest> request(WithEnviron(row.environ));
        EXPECT_EQ(request->IsPollingTask(), row.task);
        EXPECT_EQ(request->GetPollingTaskId(), row.id);
    }
}

}  // namespace
