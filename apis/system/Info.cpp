#include <sys/sysinfo.h>
#include <sys/utsname.h>

#include "System.h"
#include "webapi/APIRequest.h"
#include "webapi/APIResponse.h"

namespace {

Json::Value LoadAverages(const struct sysinfo& facts) {
    Json::Value loads(Json::arrayValue);
    for (const unsigned long load : facts.loads) {
        loads.append(static_cast<double>(load) / (1 << SI_LOAD_SHIFT));
    }
    return loads;
}

Json::UInt64 Bytes(unsigned long units, const struct sysinfo& facts) {
    return static_cast<Json::UInt64>(units) * facts.mem_unit;
}

}  // namespace

void Info(TALO::APIRequest*, TALO::APIResponse* response) {
    struct utsname host = {};
    struct sysinfo facts = {};
    (void)uname(&host);
    (void)sysinfo(&facts);
    Json::Value data(Json::objectValue);
    data["hostname"] = host.nodename;
    data["kernel"] = host.release;
    data["machine"] = host.machine;
    data["uptime"] = static_cast<Json::Int64>(facts.uptime);
    data["load"] = LoadAverages(facts);
    data["memory"]["total"] = Bytes(facts.totalram, facts);
    data["memory"]["free"] = Bytes(facts.freeram, facts);
    response->TakeSuccess(&data);
}
