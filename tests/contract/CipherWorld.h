#ifndef TESTS_CONTRACT_CIPHERWORLD_H
#define TESTS_CONTRACT_CIPHERWORLD_H

#include <memory>
#include <string>

// What a client makes of parameter lines for the appliance of this executable's side.
class CipherWorld {
  public:
    virtual ~CipherWorld() {}

    // A line under the appliance's own cipher. Of two, no line may be the same.
    virtual std::string Seal(const std::string& line) = 0;

    // A line under the key of a token.
    virtual std::string Encipher(const std::string& token, const std::string& line) = 0;
};

std::unique_ptr<CipherWorld> MakeCipherWorld();

#endif
