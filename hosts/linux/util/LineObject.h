#ifndef TALO_HOSTS_LINUX_UTIL_LINEOBJECT_H
#define TALO_HOSTS_LINUX_UTIL_LINEOBJECT_H

#include <json/json.h>

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

// Files of the configuration that settle rights have a strict JSON object a line,
// each understood by a table of members:
//
//     constexpr LineMember<Thing> kMembers[] = {{"name", true, ReadName}, ...};
//     if (ParseLineObject(begin, end, &line, &reason) &&
//         ReadLineMembers(line, kMembers, &thing, &reason)) ...
namespace host {

template <typename Thing>
struct LineMember {
    const char* name;
    bool required;
    bool (*read)(const Json::Value& value, Thing* thing);  // false for a wrong one
};

// False with `reason` when the line is no object of the strict grammar.
bool ParseLineObject(const char* begin, const char* end, Json::Value* line, std::string* reason);

// One line without its end.
std::string RenderLineObject(const Json::Value& line);

// What is wrong with a member, for ReadLineMembers.
enum class LineFault { kMissing, kNotValid };
std::string LineFaultText(LineFault fault, const char* name);

// Reads the members that the table names; others are nobody's business here. A
// line that is half understood would be a right half understood, so one wrong
// member refuses it whole, and `thing` stays untouched.
template <typename Thing, size_t kCount>
bool ReadLineMembers(const Json::Value& line, const LineMember<Thing> (&members)[kCount],
                     Thing* thing, std::string* reason) {
    Thing read;
    for (const LineMember<Thing>& member : members) {
        if (!line.isMember(member.name)) {
            if (member.required) {
                *reason = LineFaultText(LineFault::kMissing, member.name);
                return false;
            }
        } else if (!member.read(line[member.name], &read)) {
            *reason = LineFaultText(LineFault::kNotValid, member.name);
            return false;
        }
    }
    *thing = std::move(read);
    return true;
}

// An integer of that range. 1.0 is none here, whatever jsoncpp's isInt thinks.
bool ReadJsonInteger(const Json::Value& value, long long least, long long most, long long* out);

// Adds the texts of an array; false when one is none or is not accepted.
bool ReadJsonTexts(const Json::Value& value, bool (*accepts)(const std::string&),
                   std::vector<std::string>* out);

}  // namespace host

#endif
