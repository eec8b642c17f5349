#include "programs/webapi_server/Worker.h"

#include <errno.h>
#include <fcntl.h>
#include <pthread.h>
#include <signal.h>
#include <string.h>
#include <sys/prctl.h>
#include <sys/socket.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>
#include <cstdio>
#include <exception>
#include <iterator>
#include <string>
#include <utility>
#include <vector>

#include "hosts/linux/sdk/Process.h"
#include "platform/Paths.h"
#include "programs/common/CrashReply.h"
#include "programs/common/DiscardInput.h"
#include "programs/common/ErrorReply.h"
#include "programs/webapi_server/Arrivals.h"
#include "programs/webapi_server/Clock.h"
#include "programs/webapi_server/Environment.h"
#include "programs/webapi_server/Message.h"
#include "programs/webapi_server/RequestBody.h"
#include "programs/webapi_server/Restore.h"
#include "programs/webapi_server/Scgi.h"
#include "programs/webapi_server/WarmEntry.h"

namespace {

// A child of a method's must neither keep the master waiting for this worker's
// end nor speak for it.
int notInChildren[] = {-1, -1, -1};

void CloseInChild() {
    for (int& descriptor : notInChildren) {
        if (descriptor >= 0) {
            (void)close(descriptor);
            descriptor = -1;
        }
    }
}

void Log(int priority, const std::string& text) {
    std::string line = text;
    std::replace_if(
        line.begin(), line.end(),
        [](char byte) { return static_cast<unsigned char>(byte) < 0x20 || byte == 0x7f; }, '?');
    syslog(priority, "%s", line.c_str());
}

// Methods, and whoever reads the log, find the program that they know. It takes all
// of the room, which a request's own name will need.
void TakeNameOfEntry() {
    constexpr char kName[] = "entry.cgi";
    constexpr size_t kSize = sizeof kName - 1;
    const size_t room = strlen(program_invocation_name);
    if (room >= kSize) {
        memset(program_invocation_name, '/', room - kSize);
        memcpy(program_invocation_name + room - kSize, kName, kSize);
    }
    (void)prctl(PR_SET_NAME, kName);
}

// What the master does about signals is none of a method's business.
void ResetSignals() {
    for (const int number : {SIGTERM, SIGINT, SIGHUP, SIGQUIT, SIGCHLD, SIGUSR1, SIGUSR2}) {
        (void)signal(number, SIG_DFL);
    }
    (void)signal(SIGPIPE, SIG_IGN);
    sigset_t none;
    (void)sigemptyset(&none);
    (void)sigprocmask(SIG_SETMASK, &none, nullptr);
}

void SendAll(int connection, const ErrorReply& reply) {
    (void)send(connection, reply.text, reply.size, MSG_NOSIGNAL | MSG_DONTWAIT);
}

// Standard input and output while there is no request.
class Nowhere {
  public:
    Nowhere() : nowhere_(open("/dev/null", O_RDWR | O_CLOEXEC)) {
        Take();
    }
    ~Nowhere() {
        (void)close(nowhere_);
    }
    Nowhere(const Nowhere&) = delete;
    Nowhere& operator=(const Nowhere&) = delete;
    void Take() const {
        TakeInput();
        (void)dup2(nowhere_, STDOUT_FILENO);
    }
    void TakeInput() const {
        (void)dup2(nowhere_, STDIN_FILENO);
    }

  private:
    int nowhere_;
};

class Worker {
  public:
    Worker(const WorkerTask& task, const Settings& settings)
        : task_(task),
          slot_(task.slot),
          settings_(settings),
          process_(getpid()),
          end_(MillisecondsNow() + settings.workerSeconds * 1000LL),
          arrivals_(task.listener, task.control),
          state_(TALO_TASK_DIR) {
        mostMemory_ = state_.PrivateKiB() + settings.workerGrowthKiB;
        notInChildren[0] = task.control;
        notInChildren[1] = task.listener;
        notInChildren[2] = arrivals_.Descriptor();
    }
    ~Worker() {
        std::fill(std::begin(notInChildren), std::end(notInChildren), -1);
    }
    Worker(const Worker&) = delete;
    Worker& operator=(const Worker&) = delete;

    void Live() {
        int connection = -1;
        while (AwaitRequest(&connection) && Serve(connection) && MayGoOn()) {
        }
    }

  private:
    // False when there is nothing more to do here.
    bool AwaitRequest(int* connection);
    // As if ordered: kServe with a client, kCome when the next is the master's matter.
    ControlMessage AwaitClient(int* connection);
    bool Take(int* connection) const;
    bool SayIdle() const;
    ControlMessage ReceiveOrder(int* connection) const;

    void TakeConnection(int connection);
    void TakeRest(int connection) const;
    void EndReply() const;
    void EndConnection() const;

    // These answer whether the process may serve another request.
    bool Serve(int connection);
    bool ServeRead();
    bool Run();
    bool PutBack();
    bool MayGoOn();
    bool IsSlim();

    const WorkerTask task_;
    Slot* const slot_;
    const Settings& settings_;
    const pid_t process_;
    const long long end_;
    int served_ = 0;
    bool hasBody_ = false;  // the request
    pid_t callback_ = 0;    // its child for what was to happen behind the reply
    Environment environment_;
    long long mostMemory_ = 0;
    Nowhere nowhere_;
    Arrivals arrivals_;
    ProcessState state_;
};

bool Worker::AwaitRequest(int* connection) {
    ControlMessage order = AwaitClient(connection);
    if (order == kCome && !SayIdle()) {
        order = kLeave;
    }
    while (order == kCome) {
        order = ReceiveOrder(connection);
    }
    return order == kServe;
}

// While requests follow each other, the master is not needed for the next one: it sees
// what was taken when it looks, and helps itself to a connection that lasts. Who shows
// that it waits is called when that ends, so it does so before it looks again whether
// it may. Whom it was woken for it takes in any case: nobody else was.
ControlMessage Worker::AwaitClient(int* connection) {
    if (slot_->mayTake == 0 || !arrivals_.StandInLine()) {
        return kCome;
    }
    ++slot_->turns;
    if (Take(connection)) {
        return kServe;
    }
    while (slot_->mayTake != 0) {
        const Arrival arrival = arrivals_.Await();
        if (arrival == Arrival::kOrder) {
            const ControlMessage order = ReceiveOrder(connection);
            if (order != kCome) {
                return order;
            }
        } else if (arrival == Arrival::kClient && Take(connection)) {
            return kServe;
        } else if (arrival == Arrival::kNone || errno != EAGAIN) {
            return kCome;  // it cannot wait, or not accept: it would be woken again and again
        }
    }
    return kCome;
}

bool Worker::Take(int* connection) const {
    *connection = accept4(task_.listener, nullptr, nullptr, SOCK_CLOEXEC);
    if (*connection < 0) {
        return false;
    }
    slot_->answerBegun = 0;
    slot_->takenAt = MillisecondsNow();
    slot_->connection = *connection;
    ++slot_->turns;
    return true;
}

bool Worker::SayIdle() const {
    const char message = kIdle;
    return SendMessage(task_.control, &message, sizeof message, -1, 0);
}

// kLeave where there is none to come.
ControlMessage Worker::ReceiveOrder(int* connection) const {
    char order = kLeave;
    const ssize_t size = ReceiveMessage(task_.control, &order, sizeof order, connection, 0);
    if (size == sizeof order && order == kServe && *connection >= 0) {
        return kServe;
    }
    if (size > 0 && *connection >= 0) {
        (void)close(*connection);
    }
    return size == sizeof order && order == kCome ? kCome : kLeave;
}

bool Worker::Serve(int connection) {
    slot_->pid = process_;
    slot_->answerBegun = 0;
    slot_->transfers = 0;
    std::memset(slot_->api, 0, sizeof slot_->api);
    slot_->allowedMs = settings_.deadlineSeconds * 1000LL;
    slot_->began = MillisecondsNow();
    std::vector<std::string> variables;
    std::string reason;
    const ScgiResult result = ReadScgiRequest(connection, ScgiLimits(), &variables, &reason);
    if (result == ScgiResult::kRead) {
        environment_.Enter(std::move(variables));
        TakeConnection(connection);
        return ServeRead();
    }
    Log(LOG_WARNING, "a request cannot be read: " + reason);
    if (result != ScgiResult::kGone) {
        slot_->answerBegun = 1;
        SendAll(connection, ReplyFor(ReplyStatus::kBadRequest));
    }
    if (slot_->connection != 0) {
        TakeRest(connection);
    }
    (void)shutdown(connection, SHUT_RDWR);
    slot_->connection = 0;
    (void)close(connection);
    slot_->began = 0;
    return true;
}

// Of a connection that the master handed over it does that.
void Worker::TakeRest(int connection) const {
    (void)shutdown(connection, SHUT_WR);
    (void)dup2(connection, STDIN_FILENO);
    DiscardInput(true);
    nowhere_.TakeInput();
}

// Each end of input or output wakes the web server: where there is no body, nothing is
// done to the connection before its end.
void Worker::TakeConnection(int connection) {
    hasBody_ = LengthOfBody() > 0;
    (void)dup2(connection, STDOUT_FILENO);
    if (slot_->connection != 0) {
        slot_->connection = STDOUT_FILENO;
    }
    if (hasBody_) {
        (void)dup2(connection, STDIN_FILENO);
        EndInputBehindBody();
    } else {
        nowhere_.TakeInput();
    }
    (void)close(connection);
}

// Where there was no body there is nothing left to wait for.
void Worker::EndReply() const {
    if (!hasBody_) {
        (void)shutdown(STDOUT_FILENO, SHUT_RDWR);
    }
}

// Where nothing of the body is left, the reply ends for the web server before anything
// else: it closes its side then. Some would also close the client's, which would lose
// the reply if it still sends: in that case the rest is taken first.
void Worker::EndConnection() const {
    if (hasBody_) {
        if (!IsBodyStillComing()) {
            (void)shutdown(STDOUT_FILENO, SHUT_WR);
        }
        DiscardInput(true);
        (void)shutdown(STDOUT_FILENO, SHUT_RDWR);
    }
}

bool Worker::ServeRead() {
    BeginCrashReply(&slot_->answerBegun);
    const bool livesOn = Run();
    EndCrashReply();
    EndConnection();
    slot_->connection = 0;
    nowhere_.Take();
    const bool back = livesOn && PutBack();
    slot_->began = 0;
    return back;
}

bool Worker::Run() {
    WarmEntry entry(slot_, settings_.deadlineSeconds);
    entry.SetArgs(1, &program_invocation_name);
    callback_ = entry.Run(Json::Value());
    // A child of a method's that found its way here has no request to end.
    if (getpid() != process_) {
        _exit(0);
    }
    (void)fflush(stdout);
    EndReply();
    return entry.LeavesNothingBehind();
}

bool Worker::PutBack() {
    talo::ForgetRequest();
    environment_.Leave();
    const std::vector<std::string> changes = state_.Restore(callback_);
    for (const std::string& change : changes) {
        Log(LOG_ERR, std::string(slot_->api) + " left something behind: " + change);
    }
    return changes.empty();
}

bool Worker::MayGoOn() {
    ++served_;
    return served_ < settings_.workerRequests && MillisecondsNow() < end_ && IsSlim();
}

// A large request leaves much that is free.
bool Worker::IsSlim() {
    if (state_.PrivateKiB() > mostMemory_) {
        state_.ReturnMemory();
    }
    return state_.PrivateKiB() <= mostMemory_;
}

}  // namespace

int RunWorker(const WorkerTask& task, const Settings& settings) {
    static const bool registered = pthread_atfork(nullptr, nullptr, CloseInChild) == 0;
    (void)registered;
    try {
        ResetSignals();
        TakeNameOfEntry();
        task.slot->pid = getpid();
        TALO::WebEntry::WatchAnswer(&task.slot->answerBegun);
        Worker(task, settings).Live();
    } catch (const std::exception& trouble) {
        Log(LOG_ERR, std::string("the worker ends: ") + trouble.what());
    }
    return 0;
}
