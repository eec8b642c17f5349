#include "src/base/ErrorCode.h"
#include "tests/entry/EntryTest.h"

namespace {

class Relay : public EntryTest {};

TEST_F(Relay, IsAnsweredWith109) {
    EXPECT_EQ(Serve(GetMethod("echo", "&relay_nd=1")).Code(), TALO::kErrorRelay);
    EXPECT_EQ(Serve(Post("api=Test.Entry&version=1&method=echo&relay_nd=1")).Code(),
              TALO::kErrorRelay);
}

}  // namespace
