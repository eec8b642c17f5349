#include <unistd.h>

#include <cstdio>

#include "Documents.h"
#include "Groups.h"
#include "Harness.h"
#include "platform/Paths.h"
#include "platform/WebAPIUtil.h"
#include "webapi/APIRunner.h"

namespace bench {

namespace {

void ParameterLines() {
    std::vector<Subject> subjects;
    for (const int pairs : {5, 50, 500, 5000}) {
        const std::string line = ParameterLine(pairs);
        subjects.push_back({std::to_string(pairs) + " pairs", [line] {
                                Json::Value params;
                                TALO::WebAPIUtil::strPairToJsonObj(line, params, true, true);
                            }});
    }
    Compare("Split and decode a parameter line", subjects, 15, 20);
}

void LookUp() {
    TALO::APIRunner runner;
    Json::Value loaded(Json::objectValue);
    runner.InitLibDesc(loaded, "TALO.System");
    Compare("Find a method's attributes",
            {{"description loaded before",
              [&] { runner.GetMethodAttr("TALO.System", 2, "ping", "allowUpload"); }},
             {"file found, read and checked",
              [&] {
                  Json::Value descs(Json::objectValue);
                  runner.InitLibDesc(descs, "TALO.System");
              }}},
            21, 200);
}

void Call() {
    Json::Value params(Json::objectValue);
    params["text"] = "hello";
    Compare("Run TALO.System ping in this process",
            {{"Exec",
              [&] {
                  Json::Value out;
                  TALO::APIRunner::Exec(out, "TALO.System", 1, "ping", params, "root");
              }}},
            21, 50);
}

}  // namespace

void Requests() {
    if (chdir(TALO_WEBAPI_DIR) != 0) {
        std::perror(TALO_WEBAPI_DIR);
        return;
    }
    ParameterLines();
    LookUp();
    Call();
}

}  // namespace bench
