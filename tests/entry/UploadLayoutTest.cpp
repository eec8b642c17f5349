#include <gtest/gtest.h>

#include <cstring>
#include <type_traits>

#include "src/entry/APIUploadPrivate.h"
#include "tests/fake/FakePlatform.h"
#include "webapi/APIRequest.h"
#include "webapi/APIUpload.h"

using TALO::APIRequest;
using TALO::APIUpload;
using TALO::APIUploadPrivate;

// Programs built against an earlier release rely on these places.

namespace {

size_t Offset(const APIUploadPrivate& whole, const void* field) {
    return static_cast<size_t>(static_cast<const char*>(field) -
                               reinterpret_cast<const char*>(&whole));
}

// The next place behind `end` for a type of that alignment.
size_t Aligned(size_t end, size_t alignment) {
    return (end + alignment - 1) / alignment * alignment;
}

TEST(UploadLayout, IsOnePointerWithoutVirtualOperations) {
    static_assert(!std::is_polymorphic<APIUpload>::value, "");
    static_assert(!std::is_polymorphic<APIUploadPrivate>::value, "");
    static_assert(!std::is_copy_constructible<APIUpload>::value, "");
    static_assert(!std::is_copy_assignable<APIUpload>::value, "");
    EXPECT_EQ(sizeof(APIUpload), sizeof(void*));
}

TEST(UploadLayout, PointsToThePrivateHalfWithOwnerAndRequest) {
    fake::Reset();
    APIRequest request((Json::Value()));
    const APIUpload upload(&request);
    APIUploadPrivate* d = nullptr;
    std::memcpy(&d, &upload, sizeof d);
    EXPECT_EQ(d->owner, &upload);
    EXPECT_EQ(d->request, &request);
}

TEST(UploadLayout, KeepsTheOrderOfItsFields) {
    fake::Reset();
    const APIUploadPrivate whole(nullptr, nullptr);
    static_assert(std::is_same<decltype(whole.owner), APIUpload*>::value, "");
    static_assert(std::is_same<decltype(whole.request), APIRequest*>::value, "");
    static_assert(std::is_same<decltype(whole.progress),
                               void (*)(unsigned long long, unsigned long long)>::value,
                  "");
    static_assert(std::is_same<decltype(whole.fileName), char[256]>::value, "");
    static_assert(std::is_same<decltype(whole.fieldName), char[64]>::value, "");
    static_assert(std::is_same<decltype(whole.fieldValue), char[491]>::value, "");
    static_assert(std::is_same<decltype(whole.state), TALOCGIUPLOAD>::value, "");
    static_assert(std::is_same<decltype(whole.cgi), TALOCGI>::value, "");
    EXPECT_EQ(Offset(whole, &whole.owner), 0u);
    EXPECT_EQ(Offset(whole, &whole.request), sizeof(void*));
    EXPECT_EQ(Offset(whole, &whole.progress), 2 * sizeof(void*));
    EXPECT_EQ(Offset(whole, &whole.state), 3 * sizeof(void*));
    EXPECT_EQ(Offset(whole, whole.fileName), Offset(whole, &whole.state) + sizeof(TALOCGIUPLOAD));
    EXPECT_EQ(Offset(whole, whole.fieldName), Offset(whole, whole.fileName) + 256);
    EXPECT_EQ(Offset(whole, whole.fieldValue), Offset(whole, whole.fieldName) + 64);
    EXPECT_EQ(Offset(whole, &whole.cgi),
              Aligned(Offset(whole, whole.fieldValue) + 491, alignof(TALOCGI)));
    EXPECT_EQ(sizeof whole, Offset(whole, &whole.cgi) + sizeof(TALOCGI));
}

TEST(UploadLayout, StartsWithEmptyFields) {
    fake::Reset();
    const APIUploadPrivate whole(nullptr, nullptr);
    EXPECT_EQ(whole.progress, nullptr);
    EXPECT_EQ(whole.state.partSize, 0u);
    EXPECT_EQ(whole.state.status, 0);
    EXPECT_EQ(whole.state.state, nullptr);
    EXPECT_STREQ(whole.fileName, "");
    EXPECT_STREQ(whole.fieldName, "");
    EXPECT_STREQ(whole.fieldValue, "");
    EXPECT_EQ(whole.cgi.paramHash, nullptr);
}

TEST(UploadLayout, KeepsTheNumbersOfTheResults) {
    EXPECT_EQ(static_cast<int>(TALO::kUploadDone), 1);
    EXPECT_EQ(static_cast<int>(TALO::kUploadNoSpace), -2);
    EXPECT_EQ(static_cast<int>(TALO::kUploadNothing), -6);
    EXPECT_EQ(static_cast<int>(TALO::kUploadNotPending), -8);
    EXPECT_EQ(static_cast<int>(TALO::kUploadNoMemory), -9);
}

}  // namespace
