#ifndef BENCH_BENCHLOGIN_H
#define BENCH_BENCHLOGIN_H

#include <string>

namespace bench {

// An account and a session for the run; both go at its end.
class Login {
  public:
    Login();
    ~Login();
    Login(const Login&) = delete;
    Login& operator=(const Login&) = delete;
    bool IsReady() const {
        return ready_;
    }
    const std::string& Id() const {
        return id_;
    }
    static std::string User();

  private:
    std::string id_;
    bool ready_ = false;
};

}  // namespace bench

#endif
