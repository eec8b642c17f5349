#include <functional>

#include "hosts/linux/sdk/Digest.h"
#include "tests/host/slice/SliceFixture.h"
#include "tests/support/Child.h"

using talo::SliceResult;

namespace {

// Of "hello", and of nothing; as every other program computes them.
constexpr char kHello[] = "2cf24dba5fb0a30e26e83b2ac5b9e29e1b161e5c1fa7425e73043362938b9824";
constexpr char kHelloUpper[] = "2CF24DBA5FB0A30E26E83B2AC5B9E29E1B161E5C1FA7425E73043362938B9824";
constexpr char kEmpty[] = "e3b0c44298fc1c149afbf4c8996fb92427ae41e4649b934ca495991b7852b855";

// Every case has a process of its own, so that the library is loaded by nobody
// else.
class Digest : public SliceTest {
  protected:
    void Apart(const std::function<void()>& body) {
        LendDigests();
        InChild(body);
    }
    void WithoutLibrary(const std::function<void()>& body) {
        TakeDigestsAway();
        InChild(body);
    }

  private:
    static void InChild(const std::function<void()>& body) {
        EXPECT_EQ(support::InChild([&] {
                      body();
                      return 0;
                  }).status,
                  0);
    }
};

TEST_F(Digest, OfASliceLetsItIn) {
    Apart([&] {
        const std::string id = Begin(10);
        EXPECT_EQ(Send(id, 0, "hello", kHello), SliceResult::kDone);
        EXPECT_EQ(Send(id, 5, "", kEmpty), SliceResult::kDone);
        EXPECT_EQ(Send(id, 5, "hello", kHelloUpper), SliceResult::kDone);
        EXPECT_EQ(Read(DataPathOf(id)), "hellohello");
    });
}

TEST_F(Digest, ThatDiffersTakesTheSliceBackAndNoMore) {
    Apart([&] {
        const std::string id = Begin(20);
        ASSERT_EQ(Send(id, 0, "first", ""), SliceResult::kDone);
        EXPECT_EQ(Send(id, 5, "hallo", kHello), SliceResult::kWrongDigest);
        EXPECT_EQ(OffsetOf(id), 5);
        EXPECT_EQ(Read(DataPathOf(id)), "first");
        EXPECT_EQ(Send(id, 5, "hello", kHello), SliceResult::kDone);
        EXPECT_EQ(Read(DataPathOf(id)), "firsthello");
    });
}

TEST_F(Digest, OfASliceThatIsCutOffComparesNothing) {
    Apart([&] {
        const std::string id = Begin(10);
        EXPECT_EQ(SendPart(id, 0, "hel", 5, kHello), SliceResult::kCut);
        EXPECT_EQ(OffsetOf(id), 3);
        EXPECT_EQ(Read(DataPathOf(id)), "hel");
    });
}

TEST_F(Digest, OfALargeSliceCoversEveryBlock) {
    Apart([&] {
        const std::string content = Content(1000000);
        talo::Sha256 digest;
        std::string hex;
        ASSERT_TRUE(digest.Update(content.data(), content.size()) && digest.Final(&hex));
        const std::string id = Begin(content.size(), hex);
        for (const size_t place : {size_t{0}, size_t{262143}, size_t{262144}, size_t{999999}}) {
            std::string damaged = content;
            damaged[place] = static_cast<char>(damaged[place] ^ 1);
            EXPECT_EQ(Send(id, 0, damaged, hex), SliceResult::kWrongDigest) << place;
            EXPECT_EQ(OffsetOf(id), 0);
        }
        EXPECT_EQ(Send(id, 0, content, hex), SliceResult::kDone);
        talo::SliceUpload upload;
        ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        EXPECT_EQ(upload.Check(), SliceResult::kDone);
    });
}

TEST_F(Digest, OfTheWholeLetsItBeComplete) {
    Apart([&] {
        for (const char* digest : {kHello, kHelloUpper}) {
            const std::string id = Begin(5, digest);
            ASSERT_EQ(Send(id, 0, "he"), SliceResult::kDone);
            ASSERT_EQ(Send(id, 2, "llo"), SliceResult::kDone);
            talo::SliceUpload upload;
            ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
            EXPECT_EQ(upload.Check(), SliceResult::kDone);
            EXPECT_TRUE(upload.Complete());
        }
        const std::string id = Begin(0, kEmpty);
        talo::SliceUpload upload;
        ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        EXPECT_EQ(upload.Check(), SliceResult::kDone);
    });
}

TEST_F(Digest, OfTheWholeThatDiffersEndsTheUpload) {
    Apart([&] {
        const std::string id = Begin(5, kHello);
        ASSERT_EQ(Send(id, 0, "hallo"), SliceResult::kDone);
        const size_t before = OpenDescriptors();
        {
            talo::SliceUpload upload;
            ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
            EXPECT_EQ(upload.Check(), SliceResult::kWrongDigest);
            EXPECT_FALSE(upload.Complete());
        }
        EXPECT_FALSE(Exists(id));
        EXPECT_TRUE(Names().empty());
        EXPECT_EQ(OpenDescriptors(), before);
    });
}

TEST_F(Digest, ThatCannotBeComputedIsRefusedBeforeAnythingIsRead) {
    WithoutLibrary([&] {
        const std::string id = Begin(5, kHello);
        const Input input("hello");
        talo::SliceUpload upload;
        ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        EXPECT_EQ(upload.Append(0, 5, kHello), SliceResult::kNoDigest);
        EXPECT_EQ(input.Taken(), 0u);
        EXPECT_EQ(upload.Append(0, 5, ""), SliceResult::kDone);
        EXPECT_EQ(upload.Check(), SliceResult::kNoDigest);
        EXPECT_EQ(OffsetOf(id), 5);
    });
}

TEST_F(Digest, IsNotLoadedUnlessItIsAskedFor) {
    Apart([&] {
        const std::string id = Begin(5);
        EXPECT_EQ(Send(id, 0, "hello"), SliceResult::kDone);
        talo::SliceUpload upload;
        ASSERT_EQ(upload.Open(id, "mia"), SliceResult::kDone);
        EXPECT_EQ(upload.Check(), SliceResult::kDone);
        EXPECT_EQ(Read("/proc/self/maps").find("libcrypto"), std::string::npos);
        const std::string other = Begin(5);
        EXPECT_EQ(Send(other, 0, "hello", kHello), SliceResult::kDone);
        EXPECT_NE(Read("/proc/self/maps").find("libcrypto"), std::string::npos);
    });
}

}  // namespace
