#include "tests/contract/CipherWorld.h"
#include "tests/fake/FakePlatform.h"

namespace {

class FakeCipherWorld : public CipherWorld {
  public:
    FakeCipherWorld() {
        fake::Reset();
    }
    std::string Seal(const std::string& line) override {
        return "sealed:" + line;
    }
    std::string Encipher(const std::string& token, const std::string& line) override {
        return "under " + token + ":" + line;
    }
};

}  // namespace

std::unique_ptr<CipherWorld> MakeCipherWorld() {
    return std::make_unique<FakeCipherWorld>();
}
