#include "tests/entry/RelayFixture.h"

#include "tests/support/Json.h"

using support::Parse;

const std::string RelayFixture::kBlock =
    "Content-type: text/html; charset=\"UTF-8\"\r\n"
    "Cache-Control: max-age=0, no-cache, no-store, must-revalidate\r\n"
    "Pragma: no-cache\r\n"
    "Expires: 0\r\n"
    "\r\n";

RelayFixture::RelayFixture() {
    Session().user = "ann";
    Peer().response = R"({"data":"from afar","success":true})";
    DescribeFar("{}");
}

void RelayFixture::DescribeFar(const std::string& members) {
    Json::Value description = Parse(R"({"lib": "", "minVersion": 1, "maxVersion": 3,
        "methods": {"1": ["list", {"tolerant": {"allowTimeout": true}},
                          {"take": {"allowUpload": true}}, {"passive": {"passive": true}}],
                    "2": ["list"]}})");
    const Json::Value more = Parse(members);
    for (const std::string& name : more.getMemberNames()) {
        description[name] = more[name];
    }
    Json::Value file(Json::objectValue);
    file["Test.Far"] = description;
    fake::Now().WriteJson("Test.Far.lib", file);
}

Call RelayFixture::Far(const std::string& more) {
    return ByAnn(Get("api=Test.Far&version=1&method=list&relay_nd=7" + more));
}

Call RelayFixture::FarWith(const Json::Value& params) {
    Json::Value document = params;
    document["api"] = "Test.Far";
    document["version"] = 1;
    document["method"] = "list";
    return ByAnn(Post(Json::writeString(Json::StreamWriterBuilder(), document)));
}

std::string RelayFixture::Forward(const Call& call,
                                  const std::function<void(const fake::RelayCall&)>& look) {
    return Inside(call, [&look](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        EXPECT_EQ(entry.response->GetError(), 0);
        ASSERT_EQ(Peer().calls.size(), 1u);
        EXPECT_EQ(Uses("CredRequestMgr.Run"), 1);
        EXPECT_EQ(Peer().openManagers, 0);
        look(Peer().calls[0]);
    });
}

void RelayFixture::Refuse(const Call& call, int code,
                          const std::function<void(ProbeEntry&)>& look) {
    const std::string output = Inside(call, [&look](ProbeEntry& entry) {
        (void)entry.Run(Json::Value());
        EXPECT_EQ(Peer().openManagers, 0);
        if (look) {
            look(entry);
        }
    });
    EXPECT_EQ(output,
              kBlock + R"({"error":{"code":)" + std::to_string(code) + R"(},"success":false})");
}

void RelayFixture::RefuseAtOnce(const Call& call, int code) {
    Refuse(call, code, [](ProbeEntry&) { EXPECT_EQ(Operations(), ""); });
}

std::string RelayFixture::Operations() {
    std::string operations;
    for (const std::string& operation : fake::Now().journal) {
        if (operation.compare(0, 11, "CredRequest") == 0) {
            operations += operation + " ";
        }
    }
    return operations;
}
