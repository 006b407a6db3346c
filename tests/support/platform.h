/// \file
/// A platform made of memory: the functions the library expects of the system it runs on, answering from
/// tables that a test fills and writing what they are told to do into the journal (script.h).
#pragma once

#include <map>
#include <set>
#include <string>

namespace fileindex_test {

struct FakeShare {
    std::string path = {};
    bool encrypted = false;
    bool encryptionKind = false;
    bool readOnly = false;
};

constexpr int kPlainFs = 3;
constexpr int kRemoteFs = 20;
constexpr int kImageFs = 21;

struct Platform {
    static Platform &Current();

    std::map<std::string, FakeShare> shares;  ///< by name
    std::map<std::string, int> fsTypes;       ///< by the path's beginning; all other paths are kPlainFs
    std::set<std::string> mountPoints;
    std::set<std::string> recycleBins;  ///< beginnings of paths
    std::set<std::string> snapshots;    ///< beginnings of paths
    bool searchOn = false;

    int shareRecords = 0;   ///< handed out and not yet freed
    int monitorQueues = 0;  ///< constructed and not yet destroyed

    int errorCode = 0;
    std::string errorFile;
    int errorLine = 0;
};

}  // namespace fileindex_test
