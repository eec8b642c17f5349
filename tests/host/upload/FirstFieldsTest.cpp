#include <unistd.h>

#include <cstdlib>
#include <string>

#include "tests/host/upload/UploadFixture.h"

namespace {

class LoadUploadNumParams : public UploadTest {};

TEST_F(LoadUploadNumParams, ReadsThreeFieldsAndSaysHowFar) {
    const std::string head =
        Body().Field("api", "A").Field("version", "1").Open() + Body().Field("method", "m").Open();
    const std::string rest = Body().Field("x", "y").File("f", "n", "content").Whole();
    for (const size_t piece : {1u, 2u, 3u, 7u, 4096u, 65536u}) {
        Serve(
            head + rest,
            [&] {
                const First first = LoadFirst(3);
                EXPECT_EQ(first.result, 3);
                EXPECT_EQ(first.fields, (Texts{{"api", "A"}, {"version", "1"}, {"method", "m"}}));
                EXPECT_EQ(first.total, head.size() + rest.size());
                // The boundary line behind the third field is read.
                EXPECT_EQ(first.consumed, head.size() + 5);
                EXPECT_EQ(first.name, "");
                // The rest is there for whoever reads it, what lies in a block too.
                const All all = LoadAll(Dir());
                EXPECT_EQ(all.result, TALO_UPLOAD_OK);
                EXPECT_EQ(all.params, (Texts{{"x", "y"}, {"f_filename", "n"}, {"f_size", "7"}}));
                EXPECT_EQ(Content(all.files.at("f")), "content");
            },
            piece);
    }
}

TEST_F(LoadUploadNumParams, LeavesTheRestToAReaderOfParts) {
    const std::string body =
        Body().Field("a", "1").Field("b", "2").Field("c", "3").Field("d", "4").Open() +
        Body().File("f", "n", "content").Whole();
    Serve(body, [&] {
        EXPECT_EQ(LoadFirst(3).result, 3);
        // The environment of the process may say what it likes now.
        (void)setenv("CONTENT_LENGTH", "1", 1);
        PartReader reader;
        EXPECT_EQ(reader.Params(), 1);
        EXPECT_EQ(reader.Hash(), (Texts{{"d", "4"}}));
        EXPECT_EQ(reader.upload.partSize, body.size() - body.find("content"));
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
        EXPECT_EQ(Content(reader.Hash().at("f")), "content");
    });
}

TEST_F(LoadUploadNumParams, StopsBeforeAFile) {
    const std::string head = Body().Field("a", "1").Open();
    Serve(head + Body().File("f", "dir/n", "content").Field("b", "2").Whole(), [&] {
        for (int call = 0; call < 2; ++call) {
            const First first = LoadFirst(3);
            EXPECT_EQ(first.result, call == 0 ? 1 : 0);
            EXPECT_EQ(first.consumed, head.size() + 5);
            EXPECT_EQ(first.name, "n");
        }
        PartReader reader;
        EXPECT_EQ(reader.Params(), 0);
        EXPECT_STREQ(reader.fieldName, "f");
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
        EXPECT_EQ(Content(reader.Hash().at("f")), "content");
        EXPECT_EQ(reader.Hash().at("b"), "2");
    });
}

TEST_F(LoadUploadNumParams, ReadsFewerWhereThereAreFewer) {
    const std::string body = Body().Field("a", "1").Whole();
    Serve(body, [&] {
        const First first = LoadFirst(3);
        EXPECT_EQ(first.result, 1);
        EXPECT_EQ(first.fields, (Texts{{"a", "1"}}));
        EXPECT_EQ(first.consumed, body.size() - 2);
        EXPECT_EQ(LoadFirst(3).result, 0);
    });
    Serve(Body().Whole(), [&] { EXPECT_EQ(LoadFirst(3).result, 0); });
    Serve(body, [&] {
        EXPECT_EQ(LoadFirst(0).result, 0);
        EXPECT_EQ(LoadFirst(-1).result, 0);
        EXPECT_EQ(LoadFirst(1).result, 1);
    });
}

TEST_F(LoadUploadNumParams, DoesNotWaitForWhatItDoesNotNeed) {
    // The client sends three fields and no more, and waits.
    const std::string head =
        Body().Field("a", "1").Field("b", "2").Field("c", "3").Raw("--B\r\n").Open();
    SayLength("1000000");
    Serve("", [&] {
        int ends[2];
        ASSERT_EQ(pipe(ends), 0);
        (void)dup2(ends[0], STDIN_FILENO);
        ASSERT_EQ(write(ends[1], head.data(), head.size()), static_cast<ssize_t>(head.size()));
        const First first = LoadFirst(3);
        EXPECT_EQ(first.result, 3);
        EXPECT_EQ(first.total, 1000000u);
        EXPECT_EQ(first.consumed, head.size());
    });
}

TEST_F(LoadUploadNumParams, FailsOnABodyThatIsNone) {
    Serve("no form at all", [&] { EXPECT_EQ(LoadFirst(3).result, TALO_UPLOAD_MALFORMED); });
    Serve(Body().Field("a", "1").Raw("--B\r\nbad\r\n\r\n").Whole(), [&] {
        const First first = LoadFirst(3);
        EXPECT_EQ(first.result, TALO_UPLOAD_MALFORMED);
        EXPECT_TRUE(first.fields.empty());
        EXPECT_EQ(first.name, "untouched");
        EXPECT_EQ(first.total, 0u);
        EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_MALFORMED);
    });
}

}  // namespace
