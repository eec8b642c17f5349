#ifndef TALO_PROGRAMS_WEBAPI_SERVER_RESTORESTREAMS_H
#define TALO_PROGRAMS_WEBAPI_SERVER_RESTORESTREAMS_H

#include <istream>
#include <ostream>
#include <streambuf>
#include <string>
#include <vector>

// The standard streams of C and C++. What is in their buffers, and their error
// states, belong to the request that left them and go.
class RestoreStreams {
  public:
    // Gives standard output a buffer that a usual reply fits into.
    RestoreStreams();
    RestoreStreams(const RestoreStreams&) = delete;
    RestoreStreams& operator=(const RestoreStreams&) = delete;

    void Restore(std::vector<std::string>* changes);

  private:
    // A stream's manner of formatting, and where its characters go.
    class Manner {
      public:
        explicit Manner(std::ios* stream);
        // Whether there was something to put back.
        bool Restore();

      private:
        std::ios* stream_;
        std::ios manner_;
        std::streambuf* buffer_;
    };

    Manner input_;
    Manner output_;
    Manner errors_;
    Manner log_;
};

#endif
