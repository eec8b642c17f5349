#include <sys/stat.h>
#include <unistd.h>

#include <string>

#include "tests/host/upload/UploadFixture.h"

namespace {

class LoadUploadAll : public UploadTest {
  protected:
    // Serves a body that is refused; nothing may stay.
    void ExpectRefused(const std::string& body, int result, const std::string& what = "") {
        Serve(body, [&] {
            const All all = LoadAll(Dir());
            EXPECT_EQ(all.result, result) << what;
            EXPECT_TRUE(all.params.empty() && all.files.empty()) << what;
            EXPECT_EQ(LoadAll(Dir()).result, result) << what;
        });
        EXPECT_TRUE(Left().empty()) << what;
    }
};

TEST_F(LoadUploadAll, StoresFilesUnderNamesOfItsOwnAndTellsTheirFacts) {
    const std::string content("bin\0\r\n--A\xff", 11);
    const std::string body =
        Body().Field("a", "1").File("f", "..\\x/name.txt", content).Field("b", "").Whole();
    for (const size_t piece : {1u, 2u, 3u, 7u, 4096u, 65536u}) {
        Serve(
            body,
            [&] {
                const All all = LoadAll(Dir() + "//");
                EXPECT_EQ(all.result, TALO_UPLOAD_OK);
                EXPECT_EQ(
                    all.params,
                    (Texts{{"a", "1"}, {"b", ""}, {"f_filename", "name.txt"}, {"f_size", "11"}}));
                ASSERT_EQ(all.files.size(), 1u);
                const std::string path = all.files.at("f");
                EXPECT_EQ(path.substr(0, Dir().size() + 15), Dir() + "/webapi-upload-");
                EXPECT_EQ(Content(path), content);
                struct stat facts = {};
                EXPECT_EQ(stat(path.c_str(), &facts), 0);
                EXPECT_EQ(facts.st_mode & 07777, 0600u);
                // At the end there is nothing more.
                const All again = LoadAll(Dir());
                EXPECT_EQ(again.result, TALO_UPLOAD_OK);
                EXPECT_TRUE(again.params.empty() && again.files.empty());
                (void)TLIBCSysUnlink(path.c_str());
            },
            piece);
        EXPECT_TRUE(Left().empty());
    }
}

TEST_F(LoadUploadAll, StoresFilesOfEverySizeAroundABlock) {
    for (const size_t size : {0u, 1u, 4095u, 4096u, 262143u, 262144u, 262145u, 3000000u}) {
        const std::string content(size, '\r');
        Serve(Body().File("f", "n", content).Whole(), [&] {
            const All all = LoadAll(Dir());
            EXPECT_EQ(all.result, TALO_UPLOAD_OK);
            EXPECT_EQ(all.params.at("f_size"), std::to_string(size));
            EXPECT_TRUE(Content(all.files.at("f")) == content) << size;
            (void)TLIBCSysUnlink(all.files.at("f").c_str());
        });
    }
}

TEST_F(LoadUploadAll, LetsALaterFieldReplaceAnEarlierOne) {
    Serve(Body().Field("a", "1").Field("a", "2").Whole(), [&] {
        EXPECT_EQ(LoadAll(Dir()).params, (Texts{{"a", "2"}}));
    });
}

TEST_F(LoadUploadAll, NumbersFilesOfOneName) {
    const std::string body = Body()
                                 .File("f", "a", "1")
                                 .File("f", "b", "22")
                                 .File("f_size", "c", "333")
                                 .File("f", "d", "4444")
                                 .Whole();
    Serve(body, [&] {
        const All all = LoadAll(Dir());
        EXPECT_EQ(all.result, TALO_UPLOAD_OK);
        EXPECT_EQ(all.params, (Texts{{"f_filename", "a"},
                                     {"f_size", "1"},
                                     {"f_2_filename", "b"},
                                     {"f_2_size", "2"},
                                     {"f_size_2_filename", "c"},
                                     {"f_size_2_size", "3"},
                                     {"f_3_filename", "d"},
                                     {"f_3_size", "4"}}));
        EXPECT_EQ(Content(all.files.at("f")), "1");
        EXPECT_EQ(Content(all.files.at("f_2")), "22");
        EXPECT_EQ(Content(all.files.at("f_size_2")), "333");
        EXPECT_EQ(Content(all.files.at("f_3")), "4444");
    });
}

TEST_F(LoadUploadAll, DropsFieldsThatStandInAFilesPlace) {
    const std::string body = Body()
                                 .Field("f", "/etc/passwd")
                                 .Field("f_filename", "before")
                                 .File("f", "real", "x")
                                 .Field("f_size", "999")
                                 .Field("f", "/etc/shadow")
                                 .Field("other", "kept")
                                 .Whole();
    Serve(body, [&] {
        const All all = LoadAll(Dir());
        EXPECT_EQ(all.params, (Texts{{"f_filename", "real"}, {"f_size", "1"}, {"other", "kept"}}));
        EXPECT_EQ(Content(all.files.at("f")), "x");
    });
}

TEST_F(LoadUploadAll, LeavesOutAFileThatNobodyChose) {
    Serve(Body().File("f", "", "").Field("a", "1").Whole(), [&] {
        const All all = LoadAll(Dir());
        EXPECT_EQ(all.result, TALO_UPLOAD_OK);
        EXPECT_EQ(all.params, (Texts{{"a", "1"}}));
        EXPECT_TRUE(all.files.empty());
    });
    ExpectRefused(Body().File("f", "", "x").Whole(), TALO_UPLOAD_MALFORMED);
}

TEST_F(LoadUploadAll, RefusesMalformedBodiesAndLeavesNoFile) {
    const std::string file = Body().File("f", "n", std::string(100000, 'x')).Open();
    const struct {
        const char* what;
        std::string body;
    } rows[] = {
        {"no last boundary", file},
        {"a part without a name", file + "--B\r\n\r\nx\r\n--B--"},
        {"another disposition", file + "--B\r\nContent-Disposition: attachment\r\n\r\nx\r\n--B--"},
        {"two dispositions", file + "--B\r\nContent-Disposition: form-data; name=a\r\n"
                                    "Content-Disposition: form-data; name=b\r\n\r\nx\r\n--B--"},
        {"a transfer encoding", file + "--B\r\nContent-Disposition: form-data; name=a\r\n"
                                       "Content-Transfer-Encoding: base64\r\n\r\neA==\r\n--B--"},
        {"a field with NUL", file + Body().Field("a", std::string("x\0y", 3)).Whole()},
        {"a bad file name", file + Body().File("g", "..", "x").Whole()},
        {"a file name in no UTF-8", file + Body().File("g", "\xff", "x").Whole()},
        {"a tab in a file name", file + Body().File("g", "a\tb", "x").Whole()},
        {"a line end in a file name", file + Body().File("g", "a\r\nb", "x").Whole()},
        {"an unnamed file", file + Body().File("", "n", "x").Whole()},
    };
    for (const auto& row : rows) {
        ExpectRefused(row.body, TALO_UPLOAD_MALFORMED, row.what);
    }
}

TEST_F(LoadUploadAll, AcceptsPlainTransferEncodings) {
    for (const char* encoding : {"binary", "8BIT", "7bit"}) {
        Serve(std::string("--B\r\nContent-Disposition: form-data; name=a\r\n"
                          "Content-Transfer-Encoding: ") +
                  encoding + "\r\n\r\nx\r\n--B--",
              [&] {
                  EXPECT_EQ(LoadAll(Dir()).params, (Texts{{"a", "x"}}));
              });
    }
}

TEST_F(LoadUploadAll, NoticesAClientThatGoesAway) {
    const std::string file = Body().File("f", "n", std::string(500000, 'x')).Open();
    SayLength(std::to_string(file.size() + 10));
    ExpectRefused(file, TALO_UPLOAD_GONE);
    ExpectRefused("", TALO_UPLOAD_GONE);
}

TEST_F(LoadUploadAll, MissesNothingBehindTheLastBoundary) {
    const std::string body = Body().Field("a", "1").Whole();
    SayLength(std::to_string(body.size() + 10));
    Serve(body, [&] { EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_OK); });
}

TEST_F(LoadUploadAll, ReadsNoFurtherThanTheBody) {
    const std::string body = Body().File("f", "n", "x").Whole();
    SayLength(std::to_string(body.size()));
    Serve(body + "next", [&] {
        EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_OK);
        char rest[16] = "";
        EXPECT_EQ(read(0, rest, sizeof rest), 4);
        EXPECT_STREQ(rest, "next");
    });
    // The length rules, whatever follows.
    SayLength(std::to_string(body.size() - 6));
    Serve(body, [&] { EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_MALFORMED); });
}

TEST_F(LoadUploadAll, RefusesABodyThatIsNotDescribed) {
    const std::string body = Body().Field("a", "1").Whole();
    for (const char* length : {"x", "-1", "1x", " 5", "99999999999999999999999"}) {
        SayLength(length);
        ExpectRefused(body, TALO_UPLOAD_MALFORMED, length);
    }
    SayLength("");
    for (const char* type :
         {"", "text/plain; boundary=B", "multipart/form-data", "multipart/mixed; boundary=B",
          "multipart/form-data; boundary=\"a\rb\"", "multipart/form-data; boundary=\"\""}) {
        SayType(type);
        ExpectRefused(body, TALO_UPLOAD_MALFORMED, type);
    }
}

TEST_F(LoadUploadAll, AnswersAFolderThatIsNotThereWithAStoreError) {
    Serve(Body().File("f", "n", "x").Whole(),
          [&] { EXPECT_EQ(LoadAll(Dir() + "/absent").result, TALO_UPLOAD_STORE); });
    Serve(Body().Field("a", "1").Whole(),
          [&] { EXPECT_EQ(LoadAll(Dir() + "/absent").result, TALO_UPLOAD_OK); });
}

TEST_F(LoadUploadAll, KeepsTheConfiguredLimits) {
    const struct {
        const char* setting;
        std::string within;
        std::string beyond;
    } rows[] = {
        {"upload_parts=2", Body().Field("a", "").Field("b", "").Whole(),
         Body().Field("a", "").Field("b", "").Field("c", "").Whole()},
        {"upload_field_bytes=5", Body().Field("a", "12345").Field("b", "12345").Whole(),
         Body().Field("a", "123456").Whole()},
        {"upload_fields_bytes=8", Body().Field("a", "1234").Field("b", "5678").Whole(),
         Body().Field("a", "1234").Field("b", "56789").Whole()},
        {"upload_preamble_bytes=3", "abc\r\n" + Body().Whole(), "abcd\r\n" + Body().Whole()},
        {"upload_header_bytes=42", Body().Field("a", "").Whole(), Body().Field("ab", "").Whole()},
        {"upload_total_bytes=7", "--B--\r\n", "--B--\r\n "},
    };
    for (const auto& row : rows) {
        Configure(row.setting);
        Serve(row.within, [&] { EXPECT_EQ(LoadAll(Dir()).result, TALO_UPLOAD_OK) << row.setting; });
        ExpectRefused(row.beyond, TALO_UPLOAD_LIMIT, row.setting);
    }
}

TEST_F(LoadUploadAll, PassesOverSettingsThatAreNoLimits) {
    for (const char* value : {"0", "-1", "x", "10001", "1x", "99999999999999999999999"}) {
        Configure(std::string("upload_parts=") + value);
        Serve(Body().Field("a", "1").Field("b", "2").Whole(),
              [&] { EXPECT_EQ(LoadAll(Dir()).params.size(), 2u) << value; });
    }
}

TEST_F(LoadUploadAll, ToleratesMissingArguments) {
    Serve(Body().Whole(), [&] {
        TALOSZHASH* hash = nullptr;
        EXPECT_LT(TaloCgiLoadUploadAll(nullptr, &hash, "/tmp", 0), 0);
        EXPECT_LT(TaloCgiLoadUploadAll(&hash, nullptr, "/tmp", 0), 0);
        EXPECT_LT(TaloCgiLoadUploadAll(&hash, &hash, nullptr, 0), 0);
        EXPECT_LT(TaloCgiLoadUploadAll(&hash, &hash, "", 0), 0);
        EXPECT_LT(TaloCgiLoadUploadNumParams(nullptr, 3, 0, nullptr, nullptr, 0), 0);
        EXPECT_LT(TaloCgiLoadUploadFileToDir(nullptr, "", nullptr, nullptr, "", "", ""), 0);
        EXPECT_LT(
            TaloCgiLoadUploadParams(nullptr, nullptr, nullptr, nullptr, 0, nullptr, 0, nullptr, 0),
            0);
        EXPECT_EQ(hash, nullptr);
    });
}

}  // namespace
