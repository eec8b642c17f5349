#ifndef BENCH_BENCHSHARE_H
#define BENCH_BENCHSHARE_H

#include <sys/types.h>

#include <string>

namespace bench {

// A share of the private root with one tiny file, which an account may read; its
// folder and its line among the shares go at its end.
class Share {
  public:
    explicit Share(const std::string& reader);
    ~Share();
    Share(const Share&) = delete;
    Share& operator=(const Share&) = delete;
    bool IsReady() const {
        return ready_;
    }
    // The tiny file, as the API calls it.
    std::string FilePath() const;

  private:
    bool AddLine(const std::string& line);

    std::string folder_ = "/tmp/webapi-bench-XXXXXX";
    off_t oldSize_ = -1;  // of the file of shares; -1 as long as there was none
    bool added_ = false;
    bool ready_ = false;
};

}  // namespace bench

#endif
