#include "hosts/linux/cipher/CipherModule.h"

#include "tests/host/cipher/Vectors.h"

namespace {

std::string FromHex(const std::string& hex) {
    std::string bytes;
    for (size_t index = 0; index + 1 < hex.size(); index += 2) {
        bytes += static_cast<char>(std::stoi(hex.substr(index, 2), nullptr, 16));
    }
    return bytes;
}

const unsigned char* Bytes(const std::string& text) {
    return reinterpret_cast<const unsigned char*>(text.data());
}

// The published vectors of each primitive.
TEST(CipherModule, DerivesAsRfc5869Does) {
    const std::string secret(22, '\x0b');
    unsigned char out[42];
    ASSERT_EQ(taloCipherModule.derive(host::View(secret), host::View(CountUp(0x00, 13)),
                                      host::View(CountUp(0xf0, 10)), out, sizeof out),
              1);
    EXPECT_EQ(
        Hex(std::string(reinterpret_cast<char*>(out), sizeof out)),
        "3cb25f25faacd57a90434f64d0362f2a2d2d0a90cf1a5a4c5db02d56ecc4c5bf34007208d5b887185865");
    ASSERT_EQ(
        taloCipherModule.derive(host::View(secret), {nullptr, 0}, {nullptr, 0}, out, sizeof out),
        1);
    EXPECT_EQ(
        Hex(std::string(reinterpret_cast<char*>(out), sizeof out)),
        "8da4e775a563c18f715f802a063c5a31b8a11f5c5ee1879ec3454e5f3c738d2d9d201395faa4b61a96c8");
}

TEST(CipherModule, AgreesAsRfc7748Does) {
    const std::string secret =
        FromHex("a546e36bf0527c9d3b16154b82465edd62144c0ac1fc5a18506a2244ba449ac4");
    const std::string half =
        FromHex("e6db6867583030db3594c1a424b15f7c726624ec26b3353b10a903a6d0ab1c4c");
    unsigned char shared[32];
    ASSERT_EQ(taloCipherModule.agree(Bytes(secret), Bytes(half), shared), 1);
    EXPECT_EQ(Hex(std::string(reinterpret_cast<char*>(shared), sizeof shared)),
              "c3da55379de9c6908e94ea4df28d084f32eccf03491c71f754b4075577a28552");
}

// AES-256-GCM of the GCM submission, with additional data.
TEST(CipherModule, SealsAsTheGcmVectorsDo) {
    const std::string key =
        FromHex("feffe9928665731c6d6a8f9467308308feffe9928665731c6d6a8f9467308308");
    const std::string nonce = FromHex("cafebabefacedbaddecaf888");
    const std::string head = FromHex("feedfacedeadbeeffeedfacedeadbeefabaddad2");
    const std::string plain = FromHex(
        "d9313225f88406e5a55909c5aff5269a86a7a9531534f7da2e4c303d8a318a721c3c0c95956809532fcf0e24"
        "49a6b525b16aedf5aa0de657ba637b39");
    const std::string sealed = FromHex(
        "522dc1f099567d07f47f37a32a84427d643a8cdcbfe5c0c97598a2bd2555d1aa8cb08e48590dbb3da7b08b10"
        "56828838c5f61e6393ba7a0abcc9f66276fc6ece0f4e1768cddf8853bb2d551b");
    std::string out(plain.size() + 16, '\0');
    ASSERT_EQ(taloCipherModule.seal(Bytes(key), Bytes(nonce), host::View(head), host::View(plain),
                                    reinterpret_cast<unsigned char*>(&out[0])),
              1);
    EXPECT_EQ(Hex(out), Hex(sealed));
    std::string opened(plain.size(), '\0');
    ASSERT_EQ(taloCipherModule.open(Bytes(key), Bytes(nonce), host::View(head), host::View(sealed),
                                    reinterpret_cast<unsigned char*>(&opened[0])),
              1);
    EXPECT_EQ(opened, plain);
    EXPECT_EQ(taloCipherModule.open(Bytes(key), Bytes(nonce), {nullptr, 0}, host::View(sealed),
                                    reinterpret_cast<unsigned char*>(&opened[0])),
              0);
    EXPECT_EQ(opened, std::string(plain.size(), '\0'));
}

TEST(CipherModule, OpensNothingShorterThanATag) {
    const std::string key = CountUp(0, 32);
    unsigned char out[16] = {};
    for (size_t size = 0; size < 16; ++size) {
        EXPECT_EQ(
            taloCipherModule.open(Bytes(key), Bytes(key), {nullptr, 0}, {key.data(), size}, out),
            0);
    }
}

}  // namespace
