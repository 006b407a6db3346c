/// \file
/// A file descriptor that is closed at the end of its scope.
#ifndef FILEINDEXCTL_DESCRIPTOR_H
#define FILEINDEXCTL_DESCRIPTOR_H

#include <unistd.h>

#include <utility>

namespace fileindexctl {

class Descriptor {
public:
    explicit Descriptor(int number = -1) : number_(number) {}
    ~Descriptor() { Close(); }
    Descriptor(Descriptor &&other) noexcept : number_(other.Release()) {}
    Descriptor &operator=(Descriptor &&other) noexcept {
        Close();
        number_ = other.Release();
        return *this;
    }

    explicit operator bool() const { return number_ >= 0; }
    int Get() const { return number_; }
    int Release() { return std::exchange(number_, -1); }

    /// False when closing reported an error: what was written may be lost.
    bool Close() { return number_ < 0 || close(Release()) == 0; }

private:
    int number_;
};

}  // namespace fileindexctl

#endif
