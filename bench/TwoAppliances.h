#ifndef BENCH_TWOAPPLIANCES_H
#define BENCH_TWOAPPLIANCES_H

#include <sys/types.h>

#include <string>

namespace bench {

struct Appliance {
    std::string url;      // of its entry
    std::string session;  // of a user there
};

// Two appliances of the private root, served with TLS as long as this lives. The
// first may call the second.
class TwoAppliances {
  public:
    TwoAppliances();
    ~TwoAppliances();
    TwoAppliances(const TwoAppliances&) = delete;
    TwoAppliances& operator=(const TwoAppliances&) = delete;

    bool IsReady() const {
        return !second_.session.empty();
    }
    // The certificates to trust.
    const std::string& Authority() const {
        return authority_;
    }
    const Appliance& First() const {
        return first_;
    }
    const Appliance& Second() const {
        return second_;
    }

  private:
    void Read(const std::string& said);

    pid_t script_ = -1;
    int input_ = -1;  // the script ends with it
    std::string authority_;
    Appliance first_;
    Appliance second_;
};

}  // namespace bench

#endif
