#include <string>
#include <vector>

#include "tests/host/upload/UploadFixture.h"

namespace {

using Progress = std::vector<std::pair<unsigned long long, unsigned long long>>;
Progress told;

void Tell(unsigned long long done, unsigned long long total) {
    told.emplace_back(done, total);
}

class LoadUploadParts : public UploadTest {};

TEST_F(LoadUploadParts, LeavesTheFirstFilePending) {
    const std::string head = Body().Field("a", "1").Field("b", "2").Open();
    const std::string body = head + Body().File("f", "x/n.txt", "content").Whole();
    for (const size_t piece : {1u, 2u, 3u, 7u, 4096u, 65536u}) {
        Serve(
            body,
            [&] {
                PartReader reader;
                EXPECT_EQ(reader.Params(), 2);
                EXPECT_EQ(reader.upload.status, TALO_UPLOAD_OK);
                EXPECT_EQ(reader.Hash(), (Texts{{"a", "1"}, {"b", "2"}}));
                EXPECT_STREQ(reader.fileName, "n.txt");
                EXPECT_STREQ(reader.fieldName, "f");
                EXPECT_STREQ(reader.fieldValue, "n.txt");
                EXPECT_EQ(reader.upload.partSize, body.size() - body.find("content"));
                // Asking again changes nothing.
                const unsigned long long size = reader.upload.partSize;
                EXPECT_EQ(reader.Params(), 0);
                EXPECT_EQ(reader.upload.partSize, size);
                EXPECT_STREQ(reader.fileName, "n.txt");
                EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
                EXPECT_EQ(reader.upload.status, TALO_UPLOAD_OK);
                Texts hash = reader.Hash();
                EXPECT_EQ(Content(hash["f"]), "content");
                EXPECT_EQ(hash["f_filename"], "n.txt");
                EXPECT_EQ(hash["f_size"], "7");
                EXPECT_EQ(hash.size(), 5u);
                EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_NO_PART);
                EXPECT_EQ(reader.Params(), 0);
                EXPECT_EQ(reader.upload.status, TALO_UPLOAD_OK);
                EXPECT_STREQ(reader.fileName, "");
                EXPECT_STREQ(reader.fieldName, "");
                EXPECT_STREQ(reader.fieldValue, "");
                EXPECT_EQ(reader.upload.partSize, 0u);
                (void)TLIBCSysUnlink(hash["f"].c_str());
            },
            piece);
    }
}

TEST_F(LoadUploadParts, ReadsOnToTheNextFile) {
    const std::string body = Body()
                                 .File("f", "one", "1")
                                 .Field("a", "between")
                                 .File("f", "two", "22")
                                 .File("g", "three", std::string(300000, '3'))
                                 .Field("z", "behind")
                                 .Whole();
    Serve(body, [&] {
        PartReader reader;
        EXPECT_EQ(reader.Params(), 0);
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
        EXPECT_EQ(reader.Hash().at("a"), "between");
        EXPECT_EQ(Content(reader.Hash().at("f")), "1");
        // What was not told is not stored under another's name.
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_NO_PART);
        EXPECT_EQ(reader.upload.status, TALO_UPLOAD_NO_PART);
        EXPECT_EQ(reader.Params(), 0);
        EXPECT_STREQ(reader.fileName, "two");
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
        EXPECT_EQ(Content(reader.Hash().at("f")), "22");
        EXPECT_EQ(reader.Hash().at("f_filename"), "two");
        EXPECT_EQ(reader.Params(), 0);
        EXPECT_STREQ(reader.fieldName, "g");
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
        EXPECT_TRUE(Content(reader.Hash().at("g")) == std::string(300000, '3'));
        EXPECT_EQ(reader.Hash().at("z"), "behind");
    });
    EXPECT_EQ(Left().size(), 3u);
}

TEST_F(LoadUploadParts, TellsAnEmptyFileByItsSizeAndPassesOverIt) {
    const std::string body =
        Body().File("f", "empty", "").Field("a", "1").File("g", "full", "x").Whole();
    for (const size_t piece : {1u, 65536u}) {
        Serve(
            body,
            [&] {
                PartReader reader;
                reader.upload.partSize = 99;
                EXPECT_EQ(reader.Params(), 0);
                EXPECT_STREQ(reader.fileName, "empty");
                EXPECT_EQ(reader.upload.partSize, 0u);
                EXPECT_EQ(reader.Params(), 1);
                EXPECT_STREQ(reader.fileName, "full");
                EXPECT_GT(reader.upload.partSize, 0u);
            },
            piece);
    }
    // Who wants it all the same gets an empty file.
    Serve(body, [&] {
        PartReader reader;
        EXPECT_EQ(reader.Params(), 0);
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
        EXPECT_EQ(Content(reader.Hash().at("f")), "");
        EXPECT_EQ(reader.Hash().at("f_size"), "0");
        EXPECT_EQ(reader.Hash().at("a"), "1");
    });
}

TEST_F(LoadUploadParts, PassesOverAFileThatNobodyChose) {
    Serve(Body().File("f", "", "").Field("a", "1").Whole(), [&] {
        PartReader reader;
        EXPECT_EQ(reader.Params(), 1);
        EXPECT_STREQ(reader.fieldName, "");
        EXPECT_EQ(reader.upload.partSize, 0u);
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_NO_PART);
    });
}

TEST_F(LoadUploadParts, DropsFieldsThatStandInTheFilesPlace) {
    const std::string body = Body()
                                 .Field("f_size", "0")
                                 .File("f", "n", "x")
                                 .Field("f", "/etc/passwd")
                                 .Field("f_filename", "other")
                                 .Whole();
    Serve(body, [&] {
        PartReader reader;
        EXPECT_EQ(reader.Params(), 1);
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
        EXPECT_EQ(Content(reader.Hash().at("f")), "x");
        EXPECT_EQ(reader.Hash().at("f_filename"), "n");
        EXPECT_EQ(reader.Hash().at("f_size"), "1");
    });
}

TEST_F(LoadUploadParts, RefusesNamesThatDoNotFit) {
    const struct {
        size_t field;
        size_t file;
        int status;
    } rows[] = {
        {63, 255, TALO_UPLOAD_OK},
        {64, 1, TALO_UPLOAD_LIMIT},
        {1, 256, TALO_UPLOAD_MALFORMED},
    };
    for (const auto& row : rows) {
        Serve(Body().File(std::string(row.field, 'f'), std::string(row.file, 'n'), "x").Whole(),
              [&] {
                  PartReader reader;
                  EXPECT_EQ(reader.Params(), row.status < 0 ? row.status : 0);
                  EXPECT_EQ(reader.upload.status, row.status);
                  const bool fits = row.status == TALO_UPLOAD_OK;
                  EXPECT_EQ(std::string(reader.fieldName).size(), fits ? row.field : 0);
                  EXPECT_EQ(std::string(reader.fileName).size(), fits ? row.file : 0);
              });
    }
}

TEST_F(LoadUploadParts, LeavesNoFileOfABodyThatFailsBehindIt) {
    const std::string file = Body().Field("a", "1").File("f", "n", std::string(9999, 'x')).Open();
    const struct {
        std::string body;
        size_t missing;
        int status;
    } rows[] = {
        {file, 0, TALO_UPLOAD_MALFORMED},
        {file, 1, TALO_UPLOAD_GONE},
        {file.substr(0, file.size() / 2), 99, TALO_UPLOAD_GONE},
        {file + "--B\r\nbad\r\n\r\n--B--", 0, TALO_UPLOAD_MALFORMED},
    };
    for (const auto& row : rows) {
        SayLength(std::to_string(row.body.size() + row.missing));
        Serve(row.body, [&] {
            PartReader reader;
            EXPECT_EQ(reader.Params(), 1);
            const Texts before = reader.Hash();
            EXPECT_EQ(reader.File(Dir()), row.status);
            EXPECT_EQ(reader.upload.status, row.status);
            EXPECT_EQ(reader.Hash(), before);
            EXPECT_EQ(reader.Params(), row.status);
        });
        EXPECT_TRUE(Left().empty());
    }
}

TEST_F(LoadUploadParts, TellsTheProgressNowAndThenAndAtTheEnd) {
    const std::string body = Body().File("f", "n", std::string(8u << 20, 'x')).Whole();
    Serve(body, [&] {
        PartReader reader;
        reader.progress = Tell;
        EXPECT_EQ(reader.Params(), 0);
        EXPECT_FALSE(told.empty());
        EXPECT_EQ(reader.File(Dir()), TALO_UPLOAD_OK);
        for (size_t call = 0; call < told.size(); ++call) {
            EXPECT_EQ(told[call].second, body.size());
            EXPECT_GE(told[call].first, call > 0 ? told[call - 1].first : 0);
        }
        EXPECT_EQ(told.back().first, body.size());
        // Not for each block.
        EXPECT_LT(told.size(), 128u);
    });
}

TEST_F(LoadUploadParts, AreReadBeforeTheRestAtOnce) {
    const std::string body =
        Body().Field("a", "1").File("f", "n", "first").File("g", "m", "second").Whole();
    Serve(body, [&] {
        PartReader reader;
        EXPECT_EQ(reader.Params(), 1);
        const All all = LoadAll(Dir());
        EXPECT_EQ(all.result, TALO_UPLOAD_OK);
        EXPECT_EQ(Content(all.files.at("f")), "first");
        EXPECT_EQ(Content(all.files.at("g")), "second");
        EXPECT_EQ(all.params.count("a"), 0u);
    });
}

}  // namespace
