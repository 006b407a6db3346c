/// \file
/// The indexing daemon's end of the command socket.
#pragma once

#include <condition_variable>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

namespace fileindex_test {

class FakeDaemon {
public:
    enum class Mood {
        kCollecting,  ///< reads every connection to its end
        kHangingUp,   ///< closes every connection unread
        kDeaf         ///< lets callers connect until the backlog is full, and never answers
    };

    FakeDaemon() = default;
    ~FakeDaemon();
    FakeDaemon(const FakeDaemon &) = delete;
    FakeDaemon &operator=(const FakeDaemon &) = delete;

    void Start(Mood mood = Mood::kCollecting);
    void Stop();

    /// What each connection brought, byte for byte.
    std::vector<std::string> Frames();
    /// The JSON text of each connection's frame; "malformed: ..." for one that is not length, text and NUL.
    std::vector<std::string> Commands();

private:
    void Serve(Mood mood);
    void AwaitAll();

    int listener_ = -1;
    std::thread thread_;
    std::mutex mutex_;
    std::condition_variable served_;
    std::vector<std::string> frames_;
    size_t hung_up_ = 0;
};

}  // namespace fileindex_test
