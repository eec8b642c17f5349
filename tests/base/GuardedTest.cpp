#include "src/base/Guarded.h"

#include <gtest/gtest.h>
#include <json/json.h>
#include <pthread.h>

#include <new>
#include <stdexcept>

#include "tests/support/LogCapture.h"

using TALO::Guarded;

namespace {

class GuardedCall : public ::testing::Test {
  protected:
    support::LogCapture capture;
};

TEST_F(GuardedCall, RunsTheBodyAndLogsNothing) {
    bool ran = false;
    EXPECT_TRUE(Guarded("File.cpp", 3, [&] { ran = true; }));
    EXPECT_TRUE(ran);
    EXPECT_TRUE(capture.Lines().empty());
}

TEST_F(GuardedCall, LogsWhatAStandardExceptionSays) {
    EXPECT_FALSE(Guarded("File.cpp", 3, [] { throw std::runtime_error("out of paper"); }));
    ASSERT_EQ(capture.Lines().size(), 1u);
    EXPECT_EQ(capture.Lines()[0].text, "File.cpp:3 exception: out of paper");
    EXPECT_EQ(capture.Lines()[0].priority, LOG_ERR);
}

TEST_F(GuardedCall, StopsTheTypeErrorOfTheJsonLibrary) {
    EXPECT_FALSE(Guarded("File.cpp", 3, [] { Json::throwLogicError("not an integer"); }));
    EXPECT_TRUE(capture.Has("File.cpp", "exception: not an integer"));
}

TEST_F(GuardedCall, StopsAFailedAllocation) {
    EXPECT_FALSE(Guarded("File.cpp", 3, [] { throw std::bad_alloc(); }));
    EXPECT_EQ(capture.Lines().size(), 1u);
}

TEST_F(GuardedCall, StopsWhatIsNoStandardException) {
    EXPECT_FALSE(Guarded("File.cpp", 3, [] { throw 5; }));
    EXPECT_TRUE(capture.Has("File.cpp", "exception of an unknown type"));
}

TEST_F(GuardedCall, LetsTheUnwindingOfACancelledThreadPass) {
    pthread_t thread;
    const auto body = [](void*) -> void* {
        (void)Guarded("File.cpp", 3, [] {
            (void)pthread_cancel(pthread_self());
            pthread_testcancel();
        });
        return nullptr;
    };
    ASSERT_EQ(pthread_create(&thread, nullptr, body, nullptr), 0);
    void* result = nullptr;
    ASSERT_EQ(pthread_join(thread, &result), 0);
    EXPECT_EQ(result, PTHREAD_CANCELED);
    EXPECT_TRUE(capture.Lines().empty());
}

}  // namespace
