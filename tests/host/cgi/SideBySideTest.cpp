#include <stdlib.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <fstream>
#include <functional>
#include <iterator>
#include <new>
#include <numeric>
#include <random>
#include <string>

#include "hosts/linux/cgi/SessionRecord.h"
#include "tests/host/cgi/SessionFixture.h"

namespace {

constexpr int kProcesses = 4;

// Counters that processes share.
class Shared {
  public:
    explicit Shared(size_t count) : size_(count * sizeof(std::atomic<int>)) {
        memory_ = mmap(nullptr, size_, PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0);
        if (memory_ == MAP_FAILED) {
            throw std::bad_alloc();
        }
        for (size_t index = 0; index < count; ++index) {
            new (&(*this)[index]) std::atomic<int>(0);
        }
    }
    ~Shared() {
        (void)munmap(memory_, size_);
    }
    Shared(const Shared&) = delete;
    Shared& operator=(const Shared&) = delete;

    std::atomic<int>& operator[](size_t index) const {
        return static_cast<std::atomic<int>*>(memory_)[index];
    }

  private:
    void* memory_;
    const size_t size_;
};

size_t Rounds() {
    const char* text = getenv("SESSION_ROUNDS");
    return text != nullptr ? std::stoul(text) : 1000;
}

class SideBySide : public SessionTest {
  protected:
    // Runs `body` in several processes at once; it answers what went wrong, ""
    // for nothing.
    static void InProcesses(const std::function<std::string(unsigned process)>& body) {
        std::vector<pid_t> children;
        for (unsigned process = 0; process < kProcesses; ++process) {
            const pid_t child = fork();
            ASSERT_GE(child, 0);
            if (child == 0) {
                const std::string wrong = body(process);
                if (!wrong.empty()) {
                    fprintf(stderr, "process %u: %s\n", process, wrong.c_str());
                }
                _exit(wrong.empty() ? 0 : 1);
            }
            children.push_back(child);
        }
        for (const pid_t child : children) {
            int status = -1;
            ASSERT_EQ(waitpid(child, &status, 0), child);
            EXPECT_EQ(status, 0);
        }
    }

    std::vector<std::string> OpenMany(size_t count) {
        std::vector<std::string> ids;
        for (size_t index = 0; index < count; ++index) {
            ids.push_back(Open("user" + std::to_string(index)));
        }
        return ids;
    }

    // Every process meets the sessions in an order of its own.
    static std::vector<size_t> Order(size_t count, unsigned seed) {
        std::vector<size_t> order(count);
        std::iota(order.begin(), order.end(), size_t(0));
        std::shuffle(order.begin(), order.end(), std::mt19937(seed));
        return order;
    }

    // A file that has a session's name is a whole session, whenever it is read.
    std::string FindHalfWritten() const {
        for (const std::string& name : Names()) {
            std::ifstream file(PathOf(name), std::ios::binary);
            const bool ended = !file;
            const std::string content{std::istreambuf_iterator<char>(file), {}};
            talo::Session session;
            if (!ended && talo::IsSessionId(name) && !host::ParseSessionRecord(content, &session)) {
                return "half written: " + content;
            }
        }
        return std::string();
    }
};

// The life of a session of the process's own, among all the others.
std::string LiveOnce(const std::string& user) {
    talo::Session session;
    session.user = user;
    session.privilege = std::string(3000, 'p');
    std::string id;
    talo::Session found;
    if (!talo::CreateSession(session, &id) || !talo::FindSession(id, &found)) {
        return "a new session is lost";
    }
    if (found.user != user || found.privilege != session.privilege) {
        return "a session is somebody else's";
    }
    if (!talo::RenewSession(id) || !talo::FindSession(id, &found)) {
        return "a renewed session is lost";
    }
    if (!talo::EndSession(id) || talo::FindSession(id, &found)) {
        return "an ended session lives on";
    }
    return std::string();
}

TEST_F(SideBySide, SessionsOfTheirOwnAreNeverLost) {
    InProcesses([](unsigned process) {
        for (size_t round = 0; round < Rounds(); ++round) {
            const std::string wrong = LiveOnce("process" + std::to_string(process));
            if (!wrong.empty()) {
                return wrong;
            }
        }
        return std::string();
    });
    EXPECT_TRUE(Names().empty());
}

TEST_F(SideBySide, TheSameSessionsAreRenewedByAllAndStayWhole) {
    const std::vector<std::string> ids = OpenMany(8);
    InProcesses([&](unsigned process) -> std::string {
        for (size_t round = 0; round < Rounds(); ++round) {
            for (const size_t index : Order(ids.size(), process + 100 * unsigned(round))) {
                talo::Session session;
                if (!talo::RenewSession(ids[index]) || !talo::FindSession(ids[index], &session) ||
                    session.user != "user" + std::to_string(index)) {
                    return "a session is lost";
                }
            }
        }
        return talo::ListSessions().size() == ids.size() ? "" : "the list is short";
    });
    EXPECT_EQ(Names().size(), ids.size());
}

TEST_F(SideBySide, EverySessionIsEndedByExactlyOne) {
    const std::vector<std::string> ids = OpenMany(Rounds());
    const Shared ending(ids.size());
    const Shared ended(ids.size());
    InProcesses([&](unsigned process) -> std::string {
        for (const size_t index : Order(ids.size(), process)) {
            talo::Session session;
            const bool found = talo::FindSession(ids[index], &session);
            if (!found && ending[index] == 0) {
                return "a session is lost that nobody ended";
            }
            if (found && session.user != "user" + std::to_string(index)) {
                return "a session is somebody else's";
            }
            (void)talo::RenewSession(ids[index]);
            ending[index] = 1;
            ended[index] += talo::EndSession(ids[index]) ? 1 : 0;
        }
        return "";
    });
    for (size_t index = 0; index < ids.size(); ++index) {
        EXPECT_EQ(ended[index], 1) << index;
    }
    EXPECT_TRUE(Names().empty());
}

TEST_F(SideBySide, NobodyReadsAHalfWrittenFileOrListsOne) {
    const std::vector<std::string> kept = OpenMany(3);
    InProcesses([&](unsigned process) -> std::string {
        for (size_t round = 0; round < Rounds(); ++round) {
            const std::string wrong = process % 2 == 0 ? LiveOnce("writer") : FindHalfWritten();
            if (!wrong.empty()) {
                return wrong;
            }
            if (process == 3 && talo::ListSessions().size() < kept.size()) {
                return "the list lacks a session";
            }
        }
        return "";
    });
    EXPECT_EQ(Names().size(), kept.size());
}

}  // namespace
