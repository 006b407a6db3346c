/// \file
/// A daemon that accepts each connection and reads it to the end.
#pragma once

#include <thread>

namespace bench {

class Peer {
public:
    Peer();
    ~Peer();
    Peer(const Peer &) = delete;
    Peer &operator=(const Peer &) = delete;

private:
    void Serve() const;

    int listener_;
    std::thread server_;
};

}  // namespace bench
