#include <cstdlib>
#include <utility>

#include "Catalog.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"
#include "webapi/APIRunner.h"

using TALO::APIRequest;
using TALO::APIResponse;
using TALO::APIRunner;

namespace {

// Reads each description once, for the methods' attributes too.
class Descriptions : public APIRunner {
  public:
    // One at a time: all of them at once would fill the processor's caches.
    template <typename Visit>
    void VisitAll(Visit visit) {
        (void)VisitLibDesc([&](const std::string& name, Json::Value& description) {
            libDesc.clear();
            libDesc[name].swap(description);
            visit(name, libDesc[name]);
        });
    }

    // Null when there is none of that name.
    const Json::Value* Read(const std::string& name) {
        return InitLibDesc(libDesc, name) != 0 && libDesc.isMember(name) ? &libDesc[name] : nullptr;
    }
};

// An entry of a version's list names a method as a text, or as the members of
// an object.
std::vector<std::string> NamesOf(const Json::Value& entry) {
    if (entry.isString()) {
        return {entry.asString()};
    }
    return entry.isObject() ? entry.getMemberNames() : std::vector<std::string>();
}

Json::Value MethodsOf(APIRunner& runner, const std::string& name, int version,
                      const Json::Value& entries, const Json::Value& docs) {
    Json::Value methods(Json::objectValue);
    for (Json::ArrayIndex index = 0; entries.isArray() && index < entries.size(); ++index) {
        for (const std::string& method : NamesOf(entries[index])) {
            const Json::Value& attributes = runner.GetMethod(name, version, method);
            Json::Value& shown = methods[method];
            shown["attributes"] =
                attributes.isObject() ? attributes : Json::Value(Json::objectValue);
            if (docs.isObject() && docs[method].isObject()) {
                shown["doc"] = docs[method];
            }
        }
    }
    return methods;
}

bool IsOffered(const Json::Value& description, int version) {
    return version >= description["minVersion"].asInt() &&
           version <= description["maxVersion"].asInt();
}

// The decimal text of a version that can be called, else 0.
int VersionOf(const std::string& text) {
    const int version = std::atoi(text.c_str());
    return version > 0 && std::to_string(version) == text ? version : 0;
}

}  // namespace

Json::Value Entry(APIRunner& runner, const std::string& name, const Json::Value& description) {
    const Json::Value& doc = description["doc"];
    Json::Value entry(Json::objectValue);
    entry["name"] = name;
    entry["min_version"] = description["minVersion"];
    entry["max_version"] = description["maxVersion"];
    entry["auth_level"] = description["authLevel"];
    if (doc.isObject() && doc["summary"].isString()) {
        entry["summary"] = doc["summary"];
    }
    const Json::Value& docs = doc.isObject() ? doc["methods"] : Json::Value::nullSingleton();
    entry["versions"] = Json::Value(Json::objectValue);
    const Json::Value& methods = description["methods"];
    for (auto list = methods.begin(); list != methods.end(); ++list) {
        const int version = VersionOf(list.name());
        if (version > 0 && IsOffered(description, version)) {
            entry["versions"][list.name()] = MethodsOf(runner, name, version, *list, docs);
        }
    }
    return entry;
}

void List(APIRequest* request, APIResponse* response) {
    Descriptions known;
    Json::Value entries(Json::objectValue);
    known.VisitAll([&](const std::string& name, const Json::Value& description) {
        // One that another file described before is replaced.
        entries.removeMember(name);
        if (MayCall(*request, description)) {
            entries[name] = Entry(known, name, description);
        }
    });
    Json::Value data(Json::objectValue);
    Json::Value& apis = data["apis"] = Json::Value(Json::arrayValue);
    for (Json::Value& entry : entries) {
        apis.append(std::move(entry));
    }
    response->TakeSuccess(&data);
}

// An API that the caller may not call is as unknown as one that is not there.
void Describe(APIRequest* request, APIResponse* response) {
    const auto name = request->GetAndCheckString("name", APIRequest::REQUIRED, nullptr);
    if (name.IsInvalid()) {
        response->SetError(kBadParameter, "name");
        return;
    }
    Descriptions known;
    const Json::Value* const description = known.Read(name.Get());
    if (description == nullptr || !MayCall(*request, *description)) {
        response->SetError(kNoSuchAPI, name.Get());
        return;
    }
    response->SetSuccess(Entry(known, name.Get(), *description));
}
