#ifndef WEBAPI_APIBASE_H
#define WEBAPI_APIBASE_H

#include <json/json.h>

#include <string>

#include "webapi/APIExport.h"

namespace TALO {

/// The keyed store on which the request, the response and the background task
/// are built: one JSON object of named sections, each an object of keys. A
/// deriving class creates its sections once, in its constructor; the store never
/// creates one, so a misspelt section is refused instead of born.
///
///     class Lamp : public APIBase {
///       public:
///         Lamp() { store["state"] = Json::Value(Json::objectValue); }
///         virtual ~Lamp() {}
///     };
///     lamp.SetData("state", "on", true, false);           // true
///     lamp.GetData("state", "on", Json::Value(false));    // true
///     lamp.SetData("stat", "on", true, false);            // false, nothing stored
///
/// One object serves one thread. Instances are owned through the deriving class,
/// which adds the virtual destructor.
class WEBAPI_EXPORT APIBase {
  public:
    APIBase();
    APIBase(const APIBase&) = delete;
    APIBase& operator=(const APIBase&) = delete;

    /// Whether the section exists and has the key. An empty key is never present.
    virtual bool HasData(const std::string& section, const std::string& key);

    /// Merges the members of an object into a section, name by name; an earlier
    /// value of a name is replaced. With `stringOnly`, members that are no JSON
    /// string are skipped silently. False when the section does not exist or
    /// `members` is no object or has no members.
    virtual bool SetData(const std::string& section, const Json::Value& members, bool stringOnly);

    /// The same for an object that the caller can do without: its members are moved, not
    /// copied, and what it has afterwards is of no meaning. It must be no part of the store.
    bool TakeData(const std::string& section, Json::Value* members, bool stringOnly);

    /// Sets one key. False when the section does not exist or is no object, the
    /// key is empty, or `stringOnly` is set and the value is no JSON string.
    virtual bool SetData(const std::string& section, const std::string& key,
                         const Json::Value& value, bool stringOnly);

    /// The value of a key, the whole section for an empty key, or `fallback`.
    /// The reference lasts until the section changes (or as long as `fallback`).
    virtual const Json::Value& GetData(const std::string& section, const std::string& key,
                                       const Json::Value& fallback);

    /// Removes a key, or empties the section for an empty key; the section stays.
    /// False when there was nothing of that name.
    virtual bool ClearData(const std::string& section, const std::string& key);

  protected:
    ~APIBase();

    Json::Value store;
};

}  // namespace TALO

#endif
