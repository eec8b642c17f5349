#include <errno.h>
#include <glob.h>

#include "platform/System.h"
#include "src/base/JsonConvert.h"
#include "src/base/Log.h"
#include "src/runner/APIRunnerPrivate.h"
#include "src/runner/DescriptionCache.h"
#include "webapi/APIRequest.h"
#include "webapi/APIRunner.h"

namespace TALO {

namespace {

constexpr int kMaxCandidates = 4;
constexpr int kLowestPriority = -10;
constexpr int kHighestPriority = 10;

// A name becomes a part of a file's name, so it may hold nothing that leads out
// of the folder of descriptions.
bool IsAPIName(const std::string& api) {
    constexpr char kAlphanumeric[] =
        "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789";
    constexpr char kAllowed[] = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789._-";
    return api.find_first_of(kAlphanumeric) == 0 &&
           api.find_first_not_of(kAllowed) == std::string::npos;
}

// The file that holds an API: of the prefixes that end before the second to the
// fifth dot (or with the name), the longest that exists. "" when none does.
std::string FindDescriptionFile(const std::string& api) {
    std::string chosen;
    size_t dot = api.find('.');
    for (int candidate = 0; candidate < kMaxCandidates; ++candidate) {
        dot = dot == std::string::npos ? dot : api.find('.', dot + 1);
        const std::string file = api.substr(0, dot) + ".lib";
        if (TLIBCFileExist(file.c_str()) == 1) {
            chosen = file;
        }
        if (dot == std::string::npos) {
            break;
        }
    }
    return chosen;
}

// The file's content is the caller's own and goes: a copy of each description would
// be the largest part of what a request costs in a process that keeps the files.
void VisitDescriptions(APIRunner& runner, Json::Value& file, const APIRunner::DescVisitor& visit) {
    if (!file.isObject()) {
        return;
    }
    for (auto member = file.begin(); member != file.end(); ++member) {
        if (runner.CheckLibDescription(*member)) {
            visit(member.name(), runner.ApplyLibDef(*member));
        } else {
            LOG_ERROR("WebAPI description %s is not valid.", member.name().c_str());
        }
    }
}

APIRunner::DescVisitor Into(Json::Value* descs) {
    return [descs](const std::string& api, Json::Value& desc) { (*descs)[api].swap(desc); };
}

// The names of all that there are, in the order of the alphabet.
class DescriptionFiles {
  public:
    DescriptionFiles()
        : files_(), count_(glob("*.lib", 0, nullptr, &files_) == 0 ? files_.gl_pathc : 0) {}
    ~DescriptionFiles() {
        globfree(&files_);
    }
    DescriptionFiles(const DescriptionFiles&) = delete;
    DescriptionFiles& operator=(const DescriptionFiles&) = delete;
    size_t Count() const {
        return count_;
    }
    const char* Path(size_t index) const {
        return files_.gl_pathv[index];
    }

  private:
    glob_t files_;
    const size_t count_;
};

}  // namespace

int APIRunner::InitLibDesc(Json::Value& descs, const std::string& api) {
    if (api.empty()) {
        return 0;
    }
    // The name is judged first: whether a description file that happens to be
    // loaded has a member of an impossible name must not matter.
    const bool possible = IsAPIName(api);
    if (possible && FindMember(&descs, api) != nullptr) {
        return 1;
    }
    const std::string file = possible ? FindDescriptionFile(api) : std::string();
    if (file.empty()) {
        LOG_ERROR("WebAPI %s is not valid", api.c_str());
        return 0;
    }
    Json::Value content;
    errno = 0;
    if (!ReadDescriptionFile(content, file.c_str(), Keep::kWhenReadAgain)) {
        LOG_ERROR("WebAPI description file %s is not valid", file.c_str());
        return 0;
    }
    VisitDescriptions(*this, content, Into(&descs));
    return 1;
}

int APIRunner::InitLibDesc(Json::Value& descs, APIRequest* request) {
    return request != nullptr ? InitLibDesc(descs, request->GetAPIClass()) : 0;
}

int APIRunner::InitLibDesc(Json::Value& descs) {
    return VisitLibDesc(Into(&descs));
}

// Who asks for all of them will ask again, or is about to fork those who will.
int APIRunner::VisitLibDesc(const DescVisitor& visit) {
    const DescriptionFiles files;
    for (size_t index = 0; index < files.Count(); ++index) {
        Json::Value content;
        if (ReadDescriptionFile(content, files.Path(index), Keep::kAtOnce)) {
            VisitDescriptions(*this, content, visit);
        }
    }
    return files.Count() > 0 ? 1 : 0;
}

// An empty "lib" passes: it fails when the library is opened.
int APIRunner::CheckLibDescription(Json::Value& desc) {
    if (!Member(desc, "lib").isString() || !Member(desc, "minVersion").isInt() ||
        !Member(desc, "maxVersion").isInt() || !Member(desc, "methods").isObject()) {
        return 0;
    }
    const Json::Value* priority = FindMember(&desc, "priority");
    if (priority == nullptr) {
        return 1;
    }
    return priority->isInt() && priority->asInt() <= kHighestPriority &&
                   priority->asInt() >= kLowestPriority
               ? 1
               : 0;
}

Json::Value& APIRunner::ApplyLibDef(Json::Value& desc) {
    const auto fill = [&desc](const char* key, const Json::Value& value) {
        if (FindMember(&desc, key) == nullptr) {
            desc[key] = value;
        }
    };
    fill("authLevel", Member(libDef, "authLevel"));
    fill("allowUser", Member(libDef, "allowUser"));
    fill("requestFormat", "JSON");
    fill("priority", Member(libDef, "priority"));
    return desc;
}

Json::Value& APIRunner::GetMethod(const std::string& api, int version, const std::string& method) {
    const Json::Value* attributes = nullptr;
    if (InitLibDesc(libDesc, api)) {
        const Json::Value& methods = Member(Member(libDesc, api), "methods");
        const Json::Value& entries = Member(methods, std::to_string(version));
        for (Json::ArrayIndex index = 0; entries.isArray() && index < entries.size(); ++index) {
            // Only an entry's first member counts here, although any member of it
            // lists a method: a second one has the default attributes.
            const Json::Value& entry = entries[index];
            if (entry.isObject() && !entry.empty() && entry.begin().name() == method) {
                attributes = &*entry.begin();
                break;
            }
        }
    }
    if (attributes == nullptr) {
        attributes = FindMember(&libDef, "methods");
    }
    if (attributes == nullptr) {
        static Json::Value none;
        none = Json::Value();
        return none;
    }
    return const_cast<Json::Value&>(*attributes);
}

bool APIRunner::GetMethodAttr(const std::string& api, int version, const std::string& method,
                              const std::string& attr) {
    const Json::Value& attributes = GetMethod(api, version, method);
    const Json::Value& source = attributes.isObject() ? attributes : Member(libDef, "methods");
    return ToBool(Member(source, attr));
}

bool APIRunner::GetMethodAttr(APIRequest* request, const std::string& attr) {
    if (request == nullptr || attr.empty()) {
        return false;
    }
    return GetMethodAttr(request->GetAPIClass(), request->GetAPIVersion(), request->GetAPIMethod(),
                         attr);
}

}  // namespace TALO
