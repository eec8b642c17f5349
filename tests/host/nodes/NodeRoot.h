#ifndef TESTS_HOST_NODES_NODEROOT_H
#define TESTS_HOST_NODES_NODEROOT_H

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "hosts/linux/sdk/Nodes.h"

// A host without appliances, with the module that hashes. Gone at the end.
class NodeRoot : public ::testing::Test {
  public:
    NodeRoot();
    ~NodeRoot() override;

    // The file as a whole, and its mode.
    static void WriteNodes(const std::string& content, unsigned mode = 0600);
    static std::string ReadNodes();

    // The lines of an appliance that is called, and of one that may call, with more
    // members: `,"pin":"..."`.
    static std::string CalledLine(long long id, const std::string& more = "");
    static std::string CallingLine(long long id, const std::string& classes = "\"normal.local\"");

    static talo::Node Called(long long id);
    static talo::Node Calling(long long id, const std::vector<std::string>& classes);
    static void Set(const talo::Node& node);

    static bool Knows(long long id);
    static std::vector<long long> Ids();
};

// The hash of the secret "sesame", which is that of `printf sesame | sha256sum`.
extern const char kSesameHash[];

// What went to the system log since the test began.
const std::vector<std::string>& Logged();
bool WasLogged(const std::string& part);

#endif
