#include "fixture.h"

#include <json/reader.h>
#include <json/writer.h>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/stat.h>
#include <sys/syscall.h>
#include <syslog.h>
#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <functional>
#include <iostream>
#include <map>
#include <memory>
#include <sstream>

namespace fs = std::filesystem;

namespace fileindex_test {
namespace {

/// The library's places are fixed: only where they are the test's own may it empty them.
bool InPrivateNamespace() {
    return ReadFile("/proc/self/mountinfo").find("fileindex-private") != std::string::npos;
}

}  // namespace

Json::Value Parse(const std::string &text) {
    Json::CharReaderBuilder builder;
    Json::CharReaderBuilder::strictMode(&builder.settings_);
    builder["strictRoot"] = false;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value value;
    std::string errors;
    if (!reader->parse(text.data(), text.data() + text.size(), &value, &errors)) {
        std::cerr << "not JSON: " << text << "\n" << errors;
        std::abort();
    }
    return value;
}

std::string Print(const Json::Value &value) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["emitUTF8"] = true;
    return Json::writeString(builder, value);
}

std::string Canonical(const std::string &text) {
    return text == "(missing)" ? text : Print(Parse(text));
}

std::pair<std::string, std::string> Split(const std::string &line) {
    const size_t blank = std::min(line.find(' '), line.size());
    return {line.substr(0, blank), line.substr(std::min(blank + 1, line.size()))};
}

std::string Decoded(const std::string &text) {
    return text.starts_with('"') ? Parse(text).asString() : text;
}

std::string ReadFile(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        return "(missing)";
    }
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

std::string TestPath(const std::string &name) {
    const char *sources = std::getenv("SOURCE_DIR");
    return std::string(sources != nullptr ? sources : ".") + "/tests/unit/" + name;
}

void ExpectContent(const std::string &path, const std::string &found) {
    if (std::getenv("REWRITE") != nullptr) {
        WriteFile(path, found);
    }
    EXPECT_EQ(ReadFile(path), found);
}

void WriteFile(const std::string &path, const std::string &text) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file << text;
    ASSERT_TRUE(file.flush()) << path;
}

struct stat StatusOf(const std::string &path) {
    struct stat status = {};
    EXPECT_EQ(0, ::stat(path.c_str(), &status)) << path;
    return status;
}

void FileIndexTest::SetUp() {
    ASSERT_TRUE(InPrivateNamespace()) << "to be run by scripts/in-private-namespace";
    fs::remove_all(kConfigDir);
    fs::create_directories(kConfigDir);
    fs::remove(kFolderLock);
    fs::remove(kStatusLock);
    Platform::Current() = Platform();
    Script::Current().Reset();
    Forget();
    LOG_LEVEL = 3;
    ::umask(0022);
    descriptors_ = OpenDescriptors();
}

void FileIndexTest::TearDown() {
    for (const std::string &directory : directories_) {
        fs::remove_all(directory);
    }
    EXPECT_THAT(Script::Current().Finish(), IsEmpty()) << "failures that were scripted and never took place";
    daemon_.Stop();
    EXPECT_EQ(descriptors_, OpenDescriptors());
    EXPECT_EQ(0, Platform::Current().shareRecords);
    EXPECT_EQ(0, Platform::Current().monitorQueues);
    Left();  // looks at the records that no test has looked at
}

void FileIndexTest::Given(const std::string &line) {
    const std::string what = Split(line).first;
    const std::string text = Split(line).second;
    if (what.ends_with(".conf")) {
        WriteFile(std::string(kConfigDir) + "/" + what, text);
        return;
    }
    if (what.starts_with("queue")) {
        GivenQueue(text.empty() ? "" : Decoded(text) + "\n", what.substr(5));
        return;
    }
    const std::string first = Split(text).first;
    const std::string second = Split(text).second;
    Platform &platform = Platform::Current();
    const std::map<std::string, std::function<void()>> changes = {
        {"no", [&] { fs::remove_all(text.ends_with(".conf") ? kConfigDir + ("/" + text) : text); }},
        {"search", [&] { platform.searchOn = text == "on"; }},
        {"gone", [&] { platform.shares.erase(text); }},
        {"locked", [&] { platform.shares.at(text).encrypted = true; }},
        {"encrypted", [&] { platform.shares.at(text).encryptionKind = true; }},
        {"read-only", [&] { platform.shares.at(text).readOnly = true; }},
        {"share", [&] { platform.shares[Decoded(first)].path = second; }},
        {"directory", [&] { fs::create_directories(text); }},
        {"link", [&] { fs::create_symlink(second, first); }},
        {"type", [&] { platform.fsTypes[first] = std::stoi(second); }},
        {"recycle-bin", [&] { platform.recycleBins.insert(text); }},
        {"snapshot", [&] { platform.snapshots.insert(text); }},
        {"mounted", [&] { platform.mountPoints.insert(text); }},
        {"result",
         [&] {
             Fault fault;
             std::istringstream words(text);
             words >> fault.call >> fault.result >> std::hex >> fault.error >> std::ws;
             std::getline(words, fault.about);
             Fail(fault);
         }},
    };
    changes.at(what)();
}

void FileIndexTest::GivenShare(const std::string &name, const std::string &path) {
    const std::string directory = path.empty() ? "/vol1/" + name : path;
    fs::create_directories(directory);
    directories_.push_back(directory);
    Platform::Current().shares[name].path = directory;
}

void FileIndexTest::GivenQueue(const std::string &text, const std::string &suffix) {
    fs::create_directories(fs::path(kQueue).parent_path());
    WriteFile(kQueue + suffix, text);
}

std::vector<std::string> FileIndexTest::Queue() {
    std::ifstream file(kQueue);
    std::vector<std::string> lines;
    for (std::string line; std::getline(file, line);) {
        lines.push_back(line);
    }
    return lines;
}

std::string FileIndexTest::Left() {
    const std::set<std::string> numbered = {"status.cpp", "utils.cpp", "status_mgr.cpp", "index_mgr.cpp"};
    const std::set<std::string> unnumbered = {"config.cpp", "folder.cpp", "folders.cpp"};
    std::string records;
    for (const LogRecord &record : SyslogCapture::Records()) {
        EXPECT_EQ(LOG_ERR, record.priority) << record.message;
        EXPECT_TRUE(numbered.contains(record.file) || unnumbered.contains(record.file)) << record.message;
        EXPECT_GT(record.line, 0) << record.message;
        records += records.empty() ? " " : " | ";
        records += record.file + (numbered.contains(record.file) ? ":" + std::to_string(record.line) : "") + " " +
                   record.message;
    }
    SyslogCapture::Clear();
    const int code = ErrorHandler::GetError();
    ErrorHandler::SetError(FILEINDEX_ERR_NONE);
    return code == FILEINDEX_ERR_NONE && records.empty() ? "" : std::to_string(code) + records;
}

std::string FileIndexTest::AskAlone(const std::string &call) {
    const auto descriptors = OpenDescriptors();
    const std::string answer = Ask(call);
    const std::string left = Left();
    EXPECT_EQ(descriptors, OpenDescriptors()) << call;
    EXPECT_FALSE(IsLocked(kFolderLock) || IsLocked(kStatusLock)) << call;
    return answer + (left.empty() ? "" : " " + left);
}

void FileIndexTest::Forget() {
    Script::Current().ClearJournal();
    Left();
}

bool FileIndexTest::IsLocked(const std::string &lockFile) {
    const long fd = ::syscall(SYS_openat, AT_FDCWD, lockFile.c_str(), O_RDWR | O_CLOEXEC);
    const bool locked = fd >= 0 && ::syscall(SYS_flock, fd, LOCK_EX | LOCK_NB) != 0;
    if (fd >= 0) {
        ::syscall(SYS_close, fd);
    }
    return locked;
}

}  // namespace fileindex_test
