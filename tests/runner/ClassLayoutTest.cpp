#include <cstddef>
#include <cstdint>
#include <cstring>
#include <type_traits>

#include "src/runner/APIRunnerPrivate.h"
#include "tests/runner/RunnerFixture.h"

namespace {

using TALO::_tag_API_CHECK_TABLE;
using TALO::_tag_API_TABLE;
using TALO::APIRequest;
using TALO::APIResponse;
using TALO::APIRunner;

// The rows are read as the library that exports them was compiled.
static_assert(std::is_standard_layout_v<_tag_API_TABLE>);
static_assert(offsetof(_tag_API_TABLE, apiName) == 0);
static_assert(offsetof(_tag_API_TABLE, version) == sizeof(void*));
static_assert(offsetof(_tag_API_TABLE, method) == 2 * sizeof(void*));
static_assert(offsetof(_tag_API_TABLE, func) == 3 * sizeof(void*));
static_assert(sizeof(_tag_API_TABLE) == 4 * sizeof(void*));
static_assert(std::is_same_v<decltype(_tag_API_TABLE::apiName), const char*>);
static_assert(std::is_same_v<decltype(_tag_API_TABLE::version), int>);
static_assert(std::is_same_v<decltype(_tag_API_TABLE::method), const char*>);
static_assert(std::is_same_v<decltype(_tag_API_TABLE::func), void (*)(APIRequest*, APIResponse*)>);

static_assert(std::is_standard_layout_v<_tag_API_CHECK_TABLE>);
static_assert(offsetof(_tag_API_CHECK_TABLE, apiName) == 0);
static_assert(offsetof(_tag_API_CHECK_TABLE, version) == sizeof(void*));
static_assert(offsetof(_tag_API_CHECK_TABLE, method) == 2 * sizeof(void*));
static_assert(offsetof(_tag_API_CHECK_TABLE, check) == 3 * sizeof(void*));
static_assert(offsetof(_tag_API_CHECK_TABLE, reserved1) == 4 * sizeof(void*));
static_assert(offsetof(_tag_API_CHECK_TABLE, reserved2) == 5 * sizeof(void*));
static_assert(sizeof(_tag_API_CHECK_TABLE) == 6 * sizeof(void*));
static_assert(
    std::is_same_v<decltype(_tag_API_CHECK_TABLE::check), int (*)(APIRequest*, APIResponse*)>);

static_assert(std::is_polymorphic_v<APIRunner>);
static_assert(!std::has_virtual_destructor_v<APIRunner>);

// The operations whose exact form other programs were linked against.
static_assert(
    std::is_same_v<decltype(&APIRunner::CheckLibDescription), int (APIRunner::*)(Json::Value&)>);
static_assert(
    std::is_same_v<decltype(&APIRunner::ApplyLibDef), Json::Value& (APIRunner::*)(Json::Value&)>);
static_assert(std::is_same_v<decltype(&APIRunner::GetResponse), Json::Value (APIRunner::*)()>);

// A pointer to a virtual member function holds the slot's offset plus one.
template <typename Member>
size_t Slot(Member member) {
    std::uintptr_t words[2] = {};
    static_assert(sizeof words == sizeof member);
    std::memcpy(words, &member, sizeof words);
    EXPECT_EQ(words[0] % 2, 1u) << "not virtual";
    EXPECT_EQ(words[1], 0u);
    return (words[0] - 1) / sizeof(void*);
}

TEST(RunnerLayout, HasItsSixVirtualOperationsInOrder) {
    EXPECT_EQ(Slot<int (APIRunner::*)(const Json::Value&)>(&APIRunner::Run), 0u);
    EXPECT_EQ(Slot<int (APIRunner::*)(const Json::Value&)>(&APIRunner::Initialize), 1u);
    EXPECT_EQ(Slot<bool (APIRunner::*)(APIRequest*)>(&APIRunner::NeedPermission), 2u);
    EXPECT_EQ(Slot<bool (APIRunner::*)(APIRequest*, APIResponse*)>(&APIRunner::CheckPermission),
              3u);
    EXPECT_EQ(Slot<bool (APIRunner::*)(APIRequest*, APIResponse*)>(&APIRunner::HandleUpload), 4u);
    EXPECT_EQ(Slot<bool (APIRunner::*)(APIRequest*)>(&APIRunner::SkipPermission), 5u);
}

size_t Distance(const void* from, const void* to) {
    return static_cast<size_t>(static_cast<const char*>(to) - static_cast<const char*>(from));
}

class Fields : public APIRunner {
  public:
    void Expect() const {
        const APIRunner* start = this;
        struct Expected {
            void* table;
            Json::Value libDef;
            Json::Value libDesc;
            APIRequest* request;
            APIResponse* response;
            std::map<std::string, void*> libHandles;
            int compoundDepth;
            TALO::APIRunnerPrivate* d;
        } other = {};
        EXPECT_EQ(Distance(start, &libDef), Distance(&other, &other.libDef));
        EXPECT_EQ(Distance(start, &libDesc), Distance(&other, &other.libDesc));
        EXPECT_EQ(Distance(start, &request), Distance(&other, &other.request));
        EXPECT_EQ(Distance(start, &response), Distance(&other, &other.response));
        EXPECT_EQ(Distance(start, &libHandles), Distance(&other, &other.libHandles));
        EXPECT_EQ(Distance(start, &compoundDepth), Distance(&other, &other.compoundDepth));
        EXPECT_EQ(Distance(start, &d), Distance(&other, &other.d));
        EXPECT_EQ(sizeof(APIRunner), sizeof other);
    }
};

TEST(RunnerLayout, HasItsFieldsInOrder) {
    Fields().Expect();
}

TEST(RunnerLayout, HasThePrivateFieldsInOrder) {
    struct Expected {
        APIRunner* runner;
        char* argv0;
        void* unused;
        unsigned argv0Len;
        std::string procName;
        std::string origProcName;
    } other = {};
    const TALO::APIRunnerPrivate d(nullptr);
    EXPECT_EQ(Distance(&d, &d.runner), Distance(&other, &other.runner));
    EXPECT_EQ(Distance(&d, &d.argv0), Distance(&other, &other.argv0));
    EXPECT_EQ(Distance(&d, &d.argv0Len), Distance(&other, &other.argv0Len));
    EXPECT_EQ(Distance(&d, &d.procName), Distance(&other, &other.procName));
    EXPECT_EQ(Distance(&d, &d.origProcName), Distance(&other, &other.origProcName));
    EXPECT_EQ(sizeof d, sizeof other);
}

class RunnerState : public runner::Fixture {};

TEST_F(RunnerState, StartsEmpty) {
    Defaults("{}");
    EXPECT_EQ(Runner().libDef, Json::Value(Json::objectValue));
    EXPECT_EQ(Runner().libDesc, Json::Value(Json::objectValue));
    EXPECT_TRUE(Runner().libHandles.empty());
    EXPECT_EQ(Runner().compoundDepth, 0);
    EXPECT_EQ(Runner().d->runner, &Runner());
    EXPECT_EQ(Runner().d->argv0, nullptr);
    EXPECT_EQ(Runner().d->unused, nullptr);
    EXPECT_EQ(Runner().d->argv0Len, 0u);
    EXPECT_EQ(Runner().request->GetAPIClass(), "");
    EXPECT_EQ(Runner().request->GetEnv("", Json::Value()), Json::Value(Json::objectValue));
    EXPECT_EQ(Runner().response->GetBody(), Json::Value(Json::objectValue));
}

}  // namespace
