// The end of a process: what is asked when everything that is destroyed at exit is gone, and by threads that the
// end of main does not stop.
#include "harness.h"

#include <cstdlib>
#include <thread>

namespace reliability {

namespace {

bool isAsked = false;
std::atomic<int> lists = 0;  // that the thread has got

void AskForTheList() {
    std::vector<Folder> folders;
    Check(IndexMgr::List(folders) && folders.size() == 1 && folders[0].path == "/photo/a", "the list at exit");
}

void AskAtTheEnd(int /*status*/, void * /*unused*/) {
    if (!isAsked) {
        return;
    }
    Check(IsSystemPreservedFileName("VORK@file_index_queue"), "a name is forgotten at exit");
    Check(!IsSystemPreservedFileName("VORK@file_index"), "a name is made up at exit");
    AskForTheList();
    for (const int before = lists; lists < before + 100;) {
        std::this_thread::yield();  // the alarm ends a wait in vain
    }
}

/// Registered before the libraries are initialised, and so called after they are destroyed.
[[gnu::section(".preinit_array"), gnu::used]] void (*const kRegisterFirst)() = [] {
    ::on_exit(AskAtTheEnd, nullptr);
};

}  // namespace

void AtExit(const std::string &) {
    ::alarm(60);
    MakeMachine();
    WriteFile(kFolderConf, R"({"/photo/a": {"name": "a", "photo": true}})");
    AskForTheList();  // what is made at first use is destroyed before the handler is called
    isAsked = true;
    std::thread([] {
        for (;; ++lists) {
            AskForTheList();
        }
    }).detach();
    while (lists < 10) {
        std::this_thread::yield();  // so that the end comes in the middle of a question
    }
}

}  // namespace reliability
