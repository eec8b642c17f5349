#include "tests/response/Fixture.h"

namespace {

typedef Response ResponseCallbacks;
typedef TALO::APIResponse::CallbackList List;

void First(void*) {}
void Second(void* argument) {
    ++*static_cast<int*>(argument);
}

int one = 0;
int two = 0;

TEST_F(ResponseCallbacks, KeepTheOrderOfRegistration) {
    response.SetCallbackFunc(Second, &two);
    response.SetCallbackFunc(First, &one);
    response.SetCallbackFunc(First, nullptr);
    EXPECT_EQ(*response.GetCallbackFuncs(),
              (List{{Second, &two}, {First, &one}, {First, nullptr}}));
}

TEST_F(ResponseCallbacks, AreNotRunByRegistering) {
    int calls = 0;
    response.SetCallbackFunc(Second, &calls);
    EXPECT_EQ(calls, 0);
    response.GetCallbackFuncs()->front().first(response.GetCallbackFuncs()->front().second);
    EXPECT_EQ(calls, 1);
}

TEST_F(ResponseCallbacks, IgnoreANullFunction) {
    response.SetCallbackFunc(nullptr, &one);
    response.SetCallbackFunc(nullptr, nullptr);
    EXPECT_TRUE(response.GetCallbackFuncs()->empty());
}

TEST_F(ResponseCallbacks, IgnoreAPairThatIsThere) {
    response.SetCallbackFunc(First, &one);
    response.SetCallbackFunc(Second, &one);
    response.SetCallbackFunc(First, &one);
    EXPECT_EQ(*response.GetCallbackFuncs(), (List{{First, &one}, {Second, &one}}));
}

TEST_F(ResponseCallbacks, KeepTheSameFunctionWithAnotherArgument) {
    response.SetCallbackFunc(First, &one);
    response.SetCallbackFunc(First, &two);
    EXPECT_EQ(*response.GetCallbackFuncs(), (List{{First, &one}, {First, &two}}));
}

TEST_F(ResponseCallbacks, TakeOverThoseOfAnotherResponse) {
    TALO::APIResponse inner(nullptr);
    inner.SetCallbackFunc(Second, &two);
    inner.SetCallbackFunc(First, &one);
    response.SetCallbackFunc(First, &one);
    response.SetCallbackFuncs(inner.GetCallbackFuncs());
    EXPECT_EQ(*response.GetCallbackFuncs(), (List{{First, &one}, {Second, &two}}));
    EXPECT_EQ(*inner.GetCallbackFuncs(), (List{{Second, &two}, {First, &one}}));
}

TEST_F(ResponseCallbacks, DropNullFunctionsAndDuplicatesOfAList) {
    List list{{nullptr, &one}, {First, &one}, {First, &one}, {nullptr, nullptr}, {Second, &one}};
    response.SetCallbackFuncs(&list);
    EXPECT_EQ(*response.GetCallbackFuncs(), (List{{First, &one}, {Second, &one}}));
}

TEST_F(ResponseCallbacks, IgnoreANullList) {
    response.SetCallbackFunc(First, &one);
    response.SetCallbackFuncs(nullptr);
    EXPECT_EQ(response.GetCallbackFuncs()->size(), 1u);
}

TEST_F(ResponseCallbacks, TakeOverTheirOwnListWithoutChange) {
    response.SetCallbackFunc(First, &one);
    response.SetCallbackFunc(Second, &two);
    response.SetCallbackFuncs(response.GetCallbackFuncs());
    EXPECT_EQ(*response.GetCallbackFuncs(), (List{{First, &one}, {Second, &two}}));
}

TEST_F(ResponseCallbacks, AreTheListItselfAndNotACopy) {
    EXPECT_EQ(response.GetCallbackFuncs(), response.GetCallbackFuncs());
    response.GetCallbackFuncs()->push_back({First, &one});
    EXPECT_EQ(response.GetCallbackFuncs()->size(), 1u);
}

}  // namespace
