#include <webapi/webapi.h>

using TALO::APIRequest;
using TALO::APIResponse;

namespace {

enum LightError { kBadParameter = 400, kNoSuchRoom = 401 };

bool IsRoom(const std::string& name) {
    return name == "kitchen" || name == "cellar";
}

void Switch(APIRequest* request, APIResponse* response) {
    const auto room = request->GetAndCheckString("room", APIRequest::REQUIRED, nullptr);
    const auto on = request->GetAndCheckBool("on", APIRequest::OPTIONAL, nullptr);
    if (room.IsInvalid() || on.IsInvalid()) {
        response->SetError(kBadParameter, room.IsInvalid() ? "room" : "on");
        return;
    }
    if (!IsRoom(room.Get())) {
        response->SetError(kNoSuchRoom, room.Get());
        return;
    }
    Json::Value data;
    data["room"] = room.Get();
    data["on"] = on.Get(true);
    response->SetSuccess(data);
}

TALO::_tag_API_TABLE table[] = {
    {"Acme.Light", 1, "switch", Switch},
    {nullptr, 0, nullptr, nullptr},
};

}  // namespace

WEBAPI_LIBRARY_EXPORT TALO::_tag_API_TABLE* GetAPITable() {
    return table;
}
