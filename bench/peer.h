/// \file
/// A daemon that accepts each connection and reads it to the end.
#ifndef FILEINDEX_BENCH_PEER_H
#define FILEINDEX_BENCH_PEER_H

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

#endif
