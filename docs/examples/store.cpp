#include <fileindex/fileindex.h>

#include <iostream>

using VORK::FILEINDEX::Config;
using VORK::FILEINDEX::Folders;

namespace {

// Releases on every way out: a lock that was taken stays until Unlock, or until the process ends.
class Locked {
public:
    explicit Locked(Config &config) : config_(config), locked_(config.Lock(true)) {}
    ~Locked() { config_.Unlock(); }
    Locked(const Locked &) = delete;
    Locked &operator=(const Locked &) = delete;

    explicit operator bool() const { return locked_; }

private:
    Config &config_;
    bool locked_;
};

}  // namespace

int main() {
    Folders store;
    const Locked locked(store);
    if (!locked || !store.Load()) {
        std::cerr << "busy, or folder.conf cannot be read\n";
        return 1;
    }

    Json::Value folder;
    folder["path"] = "/music";
    folder["audio"] = true;
    Json::Value report;
    if (!store.Upsert(report, folder) || !store.Save()) {
        std::cerr << "not restored\n";
        return 1;
    }
    std::cout << "restored" << (report["audio"].asBool() ? ", audio files are new\n" : "\n");
}
// Output:
// restored, audio files are new
