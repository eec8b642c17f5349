#ifndef TESTS_FAKE_SHAREDDOCUMENT_H
#define TESTS_FAKE_SHAREDDOCUMENT_H

#include <json/json.h>

#include <functional>

namespace fake {

// A JSON document in memory that this process and the children it forks share. A
// change is there whole or not at all, also when a process is killed within it.
// A document that outgrows its room ends the process: no test needs one.
class SharedDocument {
  public:
    SharedDocument();
    ~SharedDocument();
    SharedDocument(const SharedDocument&) = delete;
    SharedDocument& operator=(const SharedDocument&) = delete;

    Json::Value Read();

    // Stores the document unless `change` answers false; answers the same.
    bool Change(const std::function<bool(Json::Value*)>& change);

  private:
    struct Region;
    class Lock;
    Json::Value Load() const;
    void Store(const Json::Value& document);

    Region* region;
};

}  // namespace fake

#endif
