#ifndef APIS_CATALOG_CATALOG_H
#define APIS_CATALOG_CATALOG_H

#include <json/json.h>

#include <string>

namespace TALO {
class APIRequest;
class APIResponse;
class APIRunner;
}  // namespace TALO

// Codes of TALO.Catalog.
enum CatalogError { kBadParameter = 400, kNoSuchAPI = 401 };

// Every API, version and method that the caller may call, with its attributes.
void List(TALO::APIRequest* request, TALO::APIResponse* response);

// One API, by its "name".
void Describe(TALO::APIRequest* request, TALO::APIResponse* response);

// Whether the caller of the request may call the API of that description.
bool MayCall(const TALO::APIRequest& request, const Json::Value& description);

// A description as a client sees it: versions, methods, attributes, documentation.
Json::Value Entry(TALO::APIRunner& runner, const std::string& name, const Json::Value& description);

#endif
