/// \file
/// The fixture of all unit tests: an empty machine, and verbs to furnish it and to look at what became of it.
#pragma once

#include "fake_daemon.h"
#include "platform.h"
#include "processes.h"
#include "script.h"
#include "syslog_capture.h"

#include <fileindex/fileindex.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <json/value.h>

#include <sys/stat.h>

#include <set>
#include <string>
#include <utility>
#include <vector>

namespace fileindex_test {

using testing::ElementsAre;
using testing::IsEmpty;
using namespace VORK::FILEINDEX;  // NOLINT(google-build-using-namespace): the subject of every test

constexpr char kConfigDir[] = "/usr/vork/etc/fileindex";
constexpr char kFolderConf[] = "/usr/vork/etc/fileindex/folder.conf";
constexpr char kStatusConf[] = "/usr/vork/etc/fileindex/status.conf";
constexpr char kFolderLock[] = "/tmp/fileidx_cfg_folder.lock";
constexpr char kStatusLock[] = "/tmp/fileidx_cfg_status.lock";
constexpr char kQueue[] = "/vol1/photo/@eaDir/VORK@file_index_queue";

// What Left() says when nothing else went wrong.
const std::string kBusy = "LOCK; config.cpp Failed to lock folder";
const std::string kStatusConfUnreadable =
    std::string("LOAD_JSON; config.cpp Failed to load json from ") + kStatusConf;
const std::string kStatusConfUnwritable =
    std::string("SAVE_JSON; config.cpp Failed to save json to ") + kStatusConf;

Json::Value Parse(const std::string &text);  ///< strict; a text that is no JSON ends the test program
std::string Print(const Json::Value &value);
std::string Canonical(const std::string &text);  ///< Print(Parse(text)): one spelling for each document

std::pair<std::string, std::string> Split(const std::string &line);  ///< the first word, and the rest
std::string Decoded(const std::string &text);  ///< of a line that is a JSON string if it has to be
std::string Times(size_t count, const std::string &text);

/// The error code and the records since the last look, "PATH; utils.cpp:418 message; 2 times utils.cpp:239
/// message"; empty when there are neither. The line is left out for the modules that do not fix it. Forgets both.
std::string Left();

/// The answer of "Function argument": calls.cpp has the functions.
std::string Ask(const std::string &call);
std::set<std::string> FunctionNames();

std::string ReadFile(const std::string &path);  ///< "(missing)" when there is no file
void WriteFile(const std::string &path, const std::string &text);
void GivenQueue(const std::string &text, const std::string &suffix = "");  ///< of the share photo
struct stat StatusOf(const std::string &path);

std::string TestPath(const std::string &name);  ///< of a file in tests/unit
/// Where REWRITE is set in the environment, the file gets what was found: for deliberate changes.
void ExpectContent(const std::string &path, const std::string &found);

/// status.conf with its content in reach.
class Document : public Status {
public:
    Document() = default;
    explicit Document(const std::string &text) { document_ = Parse(text); }
    [[nodiscard]] std::string Text() const { return Print(document_); }
};

class FileIndexTest : public testing::Test {
protected:
    /// With the shares photo and music, and the directory /vol1/photo/a.
    void SetUp() override;

    /// Every test ends with all descriptors, share records and monitor queues given back, with well-formed
    /// records in the log, and with every scripted failure used.
    void TearDown() override;

    /// A line of a table; README.md has the list of them.
    void Given(const std::string &line);
    static void GivenFolderConf(const std::string &text) { WriteFile(kFolderConf, text); }
    static void GivenStatusConf(const std::string &text) { WriteFile(kStatusConf, text); }
    static void Fail(Fault fault) { Script::Current().Fail(std::move(fault)); }

    static int Calls(const char *call, const std::string &about = {}) {
        return Script::Current().Calls(call, about);
    }
    static std::vector<std::string> Queue();  ///< its lines
    static std::string FolderConf() { return Canonical(ReadFile(kFolderConf)); }
    static std::string StatusConf() { return Canonical(ReadFile(kStatusConf)); }

    /// Answer, code and records of a call, which keeps no lock, no descriptor and no share record.
    static std::string AskAlone(const std::string &call);
    static void Forget();
    static bool IsLocked(const std::string &lockFile);

    FakeDaemon daemon_;

private:
    std::set<std::string> descriptors_;
};

}  // namespace fileindex_test
