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
#include <iterator>
#include <map>
#include <memory>
#include <sstream>

namespace fs = std::filesystem;

namespace fileindex_test {

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

std::string Times(size_t count, const std::string &text) {
    std::string all;
    while (count-- > 0) {
        all += text;
    }
    return all;
}

std::string ReadFile(const std::string &path) {
    std::ifstream file(path, std::ios::binary);
    return file ? std::string(std::istreambuf_iterator<char>(file), {}) : "(missing)";
}

void WriteFile(const std::string &path, const std::string &text) {
    std::ofstream file(path, std::ios::binary | std::ios::trunc);
    file << text;
    ASSERT_TRUE(file.flush()) << path;
}

void GivenQueue(const std::string &text, const std::string &suffix) {
    fs::create_directories(fs::path(kQueue).parent_path());
    WriteFile(kQueue + suffix, text);
}

struct stat StatusOf(const std::string &path) {
    struct stat status = {};
    EXPECT_EQ(0, ::stat(path.c_str(), &status)) << path;
    return status;
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

std::string Left() {
    const char *const codes[] = {
        "",          "BAD_PARAM",        "PATH", "RESERVED", "NO_SUCH_FOLDER", "EXCEED_MAX_FOLDER", "LOAD_JSON",
        "SAVE_JSON", "MALFORMED_CONFIG", "LOCK"};
    const std::set<std::string> numbered = {"status.cpp", "utils.cpp", "status_mgr.cpp", "index_mgr.cpp"};
    const std::set<std::string> unnumbered = {"config.cpp", "folder.cpp", "folders.cpp"};
    std::string left = codes[ErrorHandler::GetError()];
    std::vector<std::string> records;
    for (const LogRecord &record : SyslogCapture::Records()) {
        EXPECT_EQ(LOG_ERR, record.priority) << record.message;
        EXPECT_TRUE(numbered.contains(record.file) || unnumbered.contains(record.file)) << record.message;
        EXPECT_GT(record.line, 0) << record.message;
        // One record of these modules has the line of its statement: IsShareIndexed's.
        const bool fixed =
            numbered.contains(record.file) && (record.file != "index_mgr.cpp" || record.line == 384 ||
                                               record.message != "Failed to get share name from path: ");
        const std::string line = fixed ? ":" + std::to_string(record.line) : "";
        records.push_back(record.file + line + " " + record.message);
    }
    for (auto record = records.begin(); record != records.end();) {
        const auto other = std::find_if(record, records.end(), [&](const auto &next) { return next != *record; });
        const std::string times = other - record > 1 ? std::to_string(other - record) + " times " : "";
        left += (left.empty() ? "" : "; ") + times + *record;
        record = other;
    }
    SyslogCapture::Clear();
    ErrorHandler::SetError(FILEINDEX_ERR_NONE);
    return left;
}

void FileIndexTest::SetUp() {
    // The library's places are fixed: only where they are the test's own may it empty them.
    ASSERT_NE(ReadFile("/proc/self/mountinfo").find("fileindex-private"), std::string::npos)
        << "to be run by scripts/in-private-namespace";
    for (const char *place : {kConfigDir, kFolderLock, kStatusLock, "/vol1/photo", "/vol2/music"}) {
        fs::remove_all(place);
    }
    for (const char *directory : {kConfigDir, "/vol1/photo/a", "/vol2/music"}) {
        fs::create_directories(directory);
    }
    Platform::Current() = Platform();
    Platform::Current().shares["photo"].path = "/vol1/photo";
    Platform::Current().shares["music"].path = "/vol2/music";
    Script::Current().Reset();
    Forget();
    LOG_LEVEL = 3;
    ::umask(0022);
    descriptors_ = OpenDescriptors();
}

void FileIndexTest::TearDown() {
    EXPECT_THAT(Script::Current().Finish(), IsEmpty()) << "failures that were scripted and never took place";
    daemon_.Stop();
    EXPECT_EQ(descriptors_, OpenDescriptors());
    EXPECT_EQ(0, Platform::Current().shareRecords);
    EXPECT_EQ(0, Platform::Current().monitorQueues);
    Left();  // looks at the records that no test has looked at
}

void FileIndexTest::Given(const std::string &line) {
    const auto given = Split(line);
    const std::string &what = given.first;
    const std::string &text = given.second;
    if (what.ends_with(".conf")) {
        WriteFile(std::string(kConfigDir) + "/" + what, text);
        return;
    }
    if (what.starts_with("queue")) {
        GivenQueue(text.empty() ? "" : Decoded(text) + "\n", what.substr(5));
        return;
    }
    const auto words = Split(text);
    const std::string &first = words.first;
    const std::string &second = words.second;
    Platform &platform = Platform::Current();
    const auto share = [&platform, name = first]() -> FakeShare & { return platform.shares[Decoded(name)]; };
    std::istringstream stream(text);
    const std::set<std::string> all{std::istream_iterator<std::string>(stream), {}};
    const std::map<std::string, std::function<void()>> changes = {
        {"no", [&] { fs::remove_all(text.ends_with(".conf") ? kConfigDir + ("/" + text) : text); }},
        {"search", [&] { platform.searchOn = text == "on"; }},
        {"share", [&] { share().path = second; }},
        {"locked", [&] { share().encrypted = true; }},
        {"encrypted", [&] { share().encryptionKind = true; }},
        {"read-only", [&] { share().readOnly = true; }},
        {"directory",
         [&] { std::for_each(all.begin(), all.end(), [](auto &path) { fs::create_directories(path); }); }},
        {"link", [&] { fs::create_symlink(second, first); }},
        {"type", [&] { platform.fsTypes[first] = std::stoi(second); }},
        {"recycle-bin", [&] { platform.recycleBins = all; }},
        {"snapshot", [&] { platform.snapshots = all; }},
        {"mounted", [&] { platform.mountPoints = all; }},
        {"gone", [&] { platform.shares.erase(text); }},
        {"result",
         [&] {
             Fault fault;
             std::istringstream parts(text);
             parts >> fault.call >> fault.result >> std::hex >> fault.error >> std::ws;
             std::getline(parts, fault.about);
             Fail(fault);
         }},
    };
    changes.at(what)();
}

std::vector<std::string> FileIndexTest::Queue() {
    std::ifstream file(kQueue);
    std::vector<std::string> lines;
    for (std::string line; std::getline(file, line);) {
        lines.push_back(line);
    }
    return lines;
}

std::string FileIndexTest::AskAlone(const std::string &call) {
    const auto descriptors = OpenDescriptors();
    const std::string answer = Ask(call);
    const std::string left = Left();
    EXPECT_EQ(descriptors, OpenDescriptors()) << call;
    EXPECT_FALSE(IsLocked(kFolderLock) || IsLocked(kStatusLock)) << call;
    EXPECT_EQ(0, Platform::Current().shareRecords) << call;
    return answer + (left.empty() ? "" : "; ") + left;
}

void FileIndexTest::Forget() {
    Script::Current().ClearJournal();
    Left();
}

bool FileIndexTest::IsLocked(const std::string &lockFile) {
    const long fd = ::syscall(SYS_openat, AT_FDCWD, lockFile.c_str(), O_RDWR | O_CLOEXEC);
    const bool locked = fd >= 0 && ::syscall(SYS_flock, fd, LOCK_EX | LOCK_NB) != 0;
    ::syscall(SYS_close, fd);
    return locked;
}

}  // namespace fileindex_test
