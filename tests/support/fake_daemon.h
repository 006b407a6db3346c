/// \file
/// The indexing daemon's end of the command socket, in the same thread: a connection is read when it has been
/// closed.
#pragma once

#include <sys/socket.h>

#include <map>
#include <string>
#include <vector>

namespace fileindex_test {

class FakeDaemon {
public:
    FakeDaemon() = default;
    ~FakeDaemon() { Stop(); }
    FakeDaemon(const FakeDaemon &) = delete;
    FakeDaemon &operator=(const FakeDaemon &) = delete;

    /// Listens from now on; `hangsUp`: closes every connection at once.
    void Start(bool hangsUp = false) {
        listening = this;
        hangs_up_ = hangsUp;
    }
    static void Stop() { listening = nullptr; }

    /// What each connection brought, byte for byte.
    const std::vector<std::string> &Frames() const { return frames_; }
    /// In the place of `connect`, and after `close`.
    static int Connect(int fd, const sockaddr *address);
    static void Closed(int fd);

private:
    inline static FakeDaemon *listening = nullptr;

    bool hangs_up_ = false;
    std::map<int, int> far_ends_;  ///< by the caller's end
    std::vector<std::string> frames_;
};

}  // namespace fileindex_test
