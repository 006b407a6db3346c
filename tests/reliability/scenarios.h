/// \file
/// What can be run: "fileindex_torture NAME".
#pragma once

#include <string>

namespace reliability {

// Saving a configuration file.
void FullDisk(const std::string &fileSystem);
void Kills(const std::string &fileSystem);
void Readers();

// Many processes, many threads.
void Adders();
void Threads();
void QueueWriters();

// The command socket.
void Moods();
void WriterModel();

// What strangers leave in the library's places.
void Planted();
void ForeignLocks();

/// One changing operation between two marks in the system call trace, looked at afterwards and repeated.
void Operation(const std::string &name);
void ListOperations();

}  // namespace reliability
