#ifndef TESTS_HOST_DOWNLOAD_EXCHANGE_H
#define TESTS_HOST_DOWNLOAD_EXCHANGE_H

#include <sys/types.h>

#include <functional>
#include <string>
#include <utility>
#include <vector>

namespace exchange {

// What a process of the test's own answers as its exit status: what Output
// answered, as 0 or 1.
constexpr int kSent = 0;
constexpr int kNotSent = 1;
int Told(int result);

enum class Output { Pipe, Socket, File, NonBlockingPipe };

typedef std::vector<std::pair<std::string, std::string>> Environment;

struct Reply {
    int status = -1;  // of the process, or 1000 + the signal that ended it
    std::string raw;

    // The header block without the blank line, "(no blank line)" when it has no
    // end; the rest.
    std::string Header() const;
    std::string Body() const;

    // The value of a header line, "(none)" when there is none, "(twice)" when
    // there are more.
    std::string Line(const std::string& name) const;
};

// A process whose standard output this end reads, as a web server would.
class Server {
  public:
    Server(const Environment& environment, Output kind, const std::function<int()>& body);
    ~Server();
    Server(const Server&) = delete;
    Server& operator=(const Server&) = delete;

    // Reads at least that many bytes, fewer only at the end.
    std::string Read(size_t atLeast);
    void GoAway();

    // Reads what is left and waits for the process; `raw` is all that was read.
    Reply Finish();

  private:
    int Wait();

    int reading_ = -1;
    pid_t process_ = -1;
    std::string read_;
};

// The whole of it.
Reply Ask(const Environment& environment, const std::function<int()>& body,
          Output kind = Output::Pipe);

// The usual environment of a GET with some headers.
Environment Get(const Environment& headers = {});

// The same, by path and by an open file.
Reply AskForPath(const std::string& path, const Environment& environment = Get(),
                 const std::string& type = "text/plain", Output kind = Output::Pipe);
Reply AskForFile(const std::string& path, long position, const Environment& environment = Get(),
                 const std::string& name = "", Output kind = Output::Pipe);

// A text in which every place looks different from its neighbours; no byte of it
// is zero.
std::string Pattern(size_t size);

}  // namespace exchange

#endif
