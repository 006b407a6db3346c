// Any paths: the path functions and the rule of coverage against their definitions.

#include "coverage.h"
#include "support.h"

#include <fileindex/folder.h>
#include <fileindex/index_mgr.h>
#include <fileindex/indexability.h>
#include <fileindex/paths.h>

#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <iterator>
#include <string>
#include <vector>

namespace {

using namespace fileindex_fuzz;   // NOLINT(google-build-using-namespace): this is their program
using namespace VORK::FILEINDEX;  // NOLINT(google-build-using-namespace): the subject of every check

bool IsShare(const std::string &name) {
    return std::find(std::begin(kShares), std::end(kShares), name) != std::end(kShares);
}

/// What stands between the first character and the next "/".
std::string ShareOf(const std::string &path) {
    std::string share;
    for (std::size_t i = 1; i < path.size() && path[i] != '/'; ++i) {
        share += path[i];
    }
    return share;
}

void CheckPath(const std::string &path) {
    std::string share = "untouched";
    Require(GetShareNameByPath(share, path) == !path.empty(), "share name", path);
    Require(share == (path.empty() ? "untouched" : ShareOf(path)), "another share name", path);

    std::string full = "untouched";
    const bool known = IsShare(ShareOf(path)) && path.find('\0') == std::string::npos;
    Require(GetFullPath(full, path) == known, "full path", path);
    Require(full == (known ? "/vol1" + path : "untouched"), "another full path", path);
    if (known && path[0] == '/') {
        std::string name;
        std::string directory;
        Require(GetShareNamePathByFullPath(name, directory, full), "the way back", path);
        Require(name == share && directory == "/vol1/" + share, "another way back", path);
    }
}

void CheckReplace(const std::string &path, const std::string &name) {
    const std::string replaced = ReplaceShareName(path, name);
    if (path.empty()) {
        Require(replaced.empty(), "something replaced in nothing");
        return;
    }
    Require(replaced == "/" + name + path.substr(1 + ShareOf(path).size()), "replaced otherwise", path);
}

void CheckRule(const std::string &path, const std::string &above) {
    Require(StringStartWith(path, above) == (path.substr(0, above.size()) == above), "prefix", path);
    const bool covered = StringStartWith(path + "/", above + "/");
    Require(internal::IsAtOrUnder(path, above) == covered, "coverage", path);
    Folder folder;
    const bool resolved = folder.SetPath(above);
    Require(IndexMgr::IsPathIndexed(path, {folder}) == covered, "path indexed", path);
    Require(IndexMgr::IsPathContainIndexed(above, {folder}), "a path holds itself", above);
    Require(IndexMgr::IsFullPathIndexed("/vol1" + path, {folder}) ==
                (resolved && StringStartWith("/vol1" + path + "/", folder.GetFullPath() + "/")),
            "full path indexed", path);
}

void CheckIndexability(const std::string &path) {
    // The platform takes C strings: what stands behind a NUL is not looked at there.
    const std::string seen = path.c_str();
    const bool excluded = StringStartWith(seen, "/vol1/a/#recycle") || StringStartWith(seen, "/vol1/a/#snapshot");
    const bool nameless = path.find('/') == std::string::npos;
    const bool skipped = IsSkipIndex(path);
    Require(skipped || !(excluded || nameless), "must be skipped", path);
    const std::string name = path.substr(path.rfind('/') + 1);
    Require(skipped == (excluded || nameless || IsSystemPreservedFileName(name)), "skipped otherwise", path);
    const bool indexable = CanFullPathBeIndexed(path);
    Require(!indexable || (!excluded && StringStartWith(path, "/vol1/")), "must not be indexed", path);
    Require(!indexable || !StringStartWith(path, "/vol1/ro"), "read-only", path);
    CanPathBeIndexed(path);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size) {
    static const bool prepared = (ResetMachine(), true);
    (void)prepared;
    ForgetCalls();
    FuzzedDataProvider input(data, size);
    const std::string first = input.ConsumeRandomLengthString();
    std::string second = input.ConsumeRandomLengthString();
    if (input.ConsumeBool()) {
        second = first + second;  // seldom met by chance
    }
    const LeakCheck leaks;
    for (const std::string &path : {first, second}) {
        CheckPath(path);
        CheckPath("/" + path);
        CheckIndexability(path);
        CheckIndexability("/vol1/" + path);
    }
    CheckReplace(first, second);
    CheckRule(first, second);
    CheckRule(second, first);
    return 0;
}
