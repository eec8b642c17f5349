#ifndef TESTS_RESPONSE_FIXTURE_H
#define TESTS_RESPONSE_FIXTURE_H

#include <gtest/gtest.h>

#include <cstring>
#include <string>

#include "src/response/APIResponsePrivate.h"
#include "tests/support/Json.h"
#include "webapi/APIResponse.h"

// A response without a request, and a look into its store.
class Response : public ::testing::Test {
  protected:
    Json::Value Stored(const std::string& section, const std::string& key = "") const {
        return Private()->GetData(section, key, Json::Value("nothing stored"));
    }

    // Puts a value where the framework's own operations would put another.
    void Put(const std::string& section, const std::string& key, const Json::Value& value) {
        ASSERT_TRUE(Private()->SetData(section, key, value, false));
    }

    // Nothing but a missing section can stop a header or an option.
    void LoseSection(const std::string& section) {
        struct Opened : TALO::APIResponsePrivate {
            static Json::Value TALO::APIBase::*Store() {
                return &Opened::store;
            }
        };
        (Private()->*Opened::Store()).removeMember(section);
    }

    TALO::APIResponse response{nullptr};

  private:
    TALO::APIResponsePrivate* Private() const {
        TALO::APIResponsePrivate* d = nullptr;
        std::memcpy(&d, &response, sizeof d);
        return d;
    }
};

#endif
