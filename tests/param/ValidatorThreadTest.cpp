#include <gtest/gtest.h>

#include <atomic>
#include <set>
#include <thread>
#include <vector>

#include "tests/support/Child.h"
#include "webapi/APIValidator.h"

using TALO::APIValidator;

namespace {

TEST(ValidatorInstance, IsAlwaysTheSame) {
    APIValidator* instance = APIValidator::GetInstance();
    ASSERT_NE(instance, nullptr);
    EXPECT_EQ(APIValidator::GetInstance(), instance);
}

// In a child, which may be the first to ask: nobody has made the instance there
// when this test runs by itself.
TEST(ValidatorInstance, IsOneForThreadsThatAskAtOnce) {
    constexpr size_t kThreads = 16;
    const support::ChildResult result = support::InChild([] {
        std::atomic<size_t> waiting(0);
        std::vector<APIValidator*> seen(kThreads, nullptr);
        std::vector<std::thread> threads;
        for (size_t index = 0; index < kThreads; ++index) {
            threads.emplace_back([&, index] {
                ++waiting;
                while (waiting < kThreads) {
                    std::this_thread::yield();
                }
                seen[index] = APIValidator::GetInstance();
            });
        }
        for (std::thread& thread : threads) {
            thread.join();
        }
        const std::set<APIValidator*> instances(seen.begin(), seen.end());
        EXPECT_EQ(instances.size(), 1u);
        EXPECT_EQ(instances.count(nullptr), 0u);
        return 0;
    });
    EXPECT_EQ(result.status, 0);
}

}  // namespace
