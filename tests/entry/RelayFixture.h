#ifndef TESTS_ENTRY_RELAYFIXTURE_H
#define TESTS_ENTRY_RELAYFIXTURE_H

#include <json/json.h>

#include <functional>
#include <string>

#include "tests/entry/UploadRequestFixture.h"
#include "tests/fake/FakeRelay.h"

// An appliance that can call others, and "ann", who is logged in under the id
// "s1". Besides "Test.Entry" it knows "Test.Far", whose library is nowhere: what
// is called of it is forwarded or an error.
class RelayFixture : public UploadRequestTest {
  protected:
    RelayFixture();

    static fake::RelayScript& Peer() {
        return fake::Relay();
    }
    static fake::Session& Session() {
        return fake::Now().sessions["s1"];
    }

    // Replaces the description of "Test.Far", but for what every one has.
    static void DescribeFar(const std::string& members);

    static Call ByAnn(const Call& call) {
        return call.With("HTTP_COOKIE", "id=s1");
    }

    // Ann's call of "Test.Far" that appliance 7 shall answer.
    static Call Far(const std::string& more = "");

    // The same as a document in the body: with these parameters and no other.
    static Call FarWith(const Json::Value& params);

    // Serves a call that is forwarded once; `look` sees what was. Answers the output.
    static std::string Forward(const Call& call,
                               const std::function<void(const fake::RelayCall&)>& look);

    // Serves a call that ends with this error, and with nothing else in the reply.
    // `look` sees the entry behind it.
    static void Refuse(const Call& call, int code,
                       const std::function<void(ProbeEntry&)>& look = {});

    // The same; nothing may have been queued either.
    static void RefuseAtOnce(const Call& call, int code);

    // The operations on the platform's client of other appliances, in their order.
    static std::string Operations();

    // What stands before every answer of another appliance.
    static const std::string kBlock;
};

#endif
