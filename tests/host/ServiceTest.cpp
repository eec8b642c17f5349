#include <errno.h>
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>

#include "platform/Paths.h"
#include "platform/System.h"
#include "tests/support/Child.h"
#include "tests/support/TempFolder.h"

namespace {

// Stands in for the integrator's program; puts back what was there.
class Service : public ::testing::Test {
  protected:
    void SetUp() override {
        const std::filesystem::path program(TALO_SERVICE_PROGRAM);
        std::filesystem::create_directories(program.parent_path());
        if (std::filesystem::exists(program)) {
            std::filesystem::rename(program, kept_);
        }
    }

    void TearDown() override {
        std::filesystem::remove(TALO_SERVICE_PROGRAM);
        if (std::filesystem::exists(kept_)) {
            std::filesystem::rename(kept_, TALO_SERVICE_PROGRAM);
        }
    }

    void WriteProgram(const std::string& script) {
        std::ofstream(TALO_SERVICE_PROGRAM) << "#!/bin/sh\n" << script << "\n";
        ASSERT_EQ(chmod(TALO_SERVICE_PROGRAM, 0755), 0);
    }

    std::string Trace() const {
        std::ifstream file(folder_.Path("trace"));
        return {std::istreambuf_iterator<char>(file), {}};
    }

    support::TempFolder folder_;
    const std::string kept_ = TALO_SERVICE_PROGRAM ".kept";
};

int RestartHttpd() {
    return TLIBNetService(static_cast<int>(0x80000000u), 3, 0);
}

TEST_F(Service, RunsTheProgramWithServiceAndActionAsWords) {
    WriteProgram("echo \"$#:$1:$2\" >> " + folder_.Path("trace"));
    EXPECT_EQ(RestartHttpd(), 0);
    EXPECT_EQ(Trace(), "2:httpd:restart\n");
}

TEST_F(Service, FailsWithAProgramThatFails) {
    WriteProgram("exit 3");
    EXPECT_EQ(RestartHttpd(), -1);
    WriteProgram("kill -TERM $$");
    EXPECT_EQ(RestartHttpd(), -1);
}

TEST_F(Service, FailsWithoutAProgramThatCanRun) {
    EXPECT_EQ(RestartHttpd(), -1);
    EXPECT_EQ(errno, ENOENT);
    WriteProgram("exit 0");
    ASSERT_EQ(chmod(TALO_SERVICE_PROGRAM, 0644), 0);
    EXPECT_EQ(RestartHttpd(), -1);
    EXPECT_EQ(errno, EACCES);
}

TEST_F(Service, RunsNothingForAnotherServiceOrAction) {
    WriteProgram("echo run >> " + folder_.Path("trace"));
    EXPECT_EQ(TLIBNetService(1, 3, 0), -1);
    EXPECT_EQ(TLIBNetService(static_cast<int>(0x80000000u), 1, 0), -1);
    EXPECT_EQ(Trace(), "");
}

// A CGI program ignores SIGPIPE; what it starts must not inherit that.
TEST_F(Service, GivesTheProgramItsSignalsBack) {
    WriteProgram("grep SigIgn /proc/$$/status > " + folder_.Path("trace"));
    const support::ChildResult result = support::InChild([] {
        (void)signal(SIGPIPE, SIG_IGN);
        return RestartHttpd();
    });
    EXPECT_EQ(result.status, 0);
    const std::string trace = Trace();
    const unsigned long long ignored = std::stoull(trace.substr(trace.find(':') + 1), nullptr, 16);
    EXPECT_EQ(ignored & (1ULL << (SIGPIPE - 1)), 0u) << trace;
}

}  // namespace
