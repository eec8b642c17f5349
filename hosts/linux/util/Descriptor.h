#ifndef TALO_HOSTS_LINUX_UTIL_DESCRIPTOR_H
#define TALO_HOSTS_LINUX_UTIL_DESCRIPTOR_H

#include <unistd.h>

namespace host {

// An open descriptor, closed at the end. -1 is none.
class Descriptor {
  public:
    explicit Descriptor(int number) : number_(number) {}
    ~Descriptor() {
        if (number_ >= 0) {
            (void)close(number_);
        }
    }
    Descriptor(const Descriptor&) = delete;
    Descriptor& operator=(const Descriptor&) = delete;
    int Get() const {
        return number_;
    }

  private:
    int number_;
};

}  // namespace host

#endif
