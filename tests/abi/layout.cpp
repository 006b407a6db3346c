// What compiled callers have built in: values, sizes, offsets and slots. A change here breaks them without a word
// from the linker, so it needs a new SONAME.

#include <fileindex/fileindex.h>

#include <cstddef>
#include <cstdio>
#include <cstring>
#include <string>

using namespace VORK::FILEINDEX;

static_assert(FILEINDEX_ERR_NONE == 0 && FILEINDEX_ERR_BAD_PARAM == 1 && FILEINDEX_ERR_PATH == 2 &&
                  FILEINDEX_ERR_RESERVED == 3 && FILEINDEX_ERR_NO_SUCH_FOLDER == 4 &&
                  FILEINDEX_ERR_EXCEED_MAX_FOLDER == 5 && FILEINDEX_ERR_LOAD_JSON == 6 &&
                  FILEINDEX_ERR_SAVE_JSON == 7 && FILEINDEX_ERR_MALFORMED_CONFIG == 8 && FILEINDEX_ERR_LOCK == 9,
              "management programs store these codes");
static_assert(sizeof(_tag_fileindex_err_) == sizeof(int) && sizeof(LOG_LEVEL) == sizeof(int), "plain integers");

namespace {

constexpr std::size_t kText = sizeof(std::string);
constexpr std::size_t kWord = sizeof(void *);

bool Check(const char *what, std::size_t is, std::size_t expected) {
    if (is != expected) {
        std::printf("%s: %zu, not %zu\n", what, is, expected);
    }
    return is == expected;
}

std::size_t OffsetIn(const Folder &folder, const void *member) {
    return static_cast<std::size_t>(static_cast<const char *>(member) - reinterpret_cast<const char *>(&folder));
}

/// In the Itanium ABI a pointer to a virtual member holds the function's byte offset in the table, plus one.
template <typename Function>
std::size_t SlotOf(Function function) {
    std::size_t offset = 0;
    std::memcpy(&offset, &function, sizeof(offset));
    return (offset - 1) / sizeof(void *);
}

template <typename Class>
bool CheckSlots(const char *name) {
    // 0 and 1 are the two destructors.
    return Check(name, SlotOf(&Class::Load), 2) & Check(name, SlotOf(&Class::Save), 3) &
           Check(name, SlotOf(&Class::GetLockPath), 4) & Check(name, SlotOf(&Class::GetPath), 5);
}

/// The library's own tables have to hold the functions where this program looks for them.
bool CheckCalls() {
    Folders folders;
    Status status;
    Config *const configs[] = {&folders, &status};
    const char *const names[] = {"folder", "status"};
    bool good = true;
    for (int i = 0; i < 2; ++i) {
        const std::string name = names[i];
        good &= configs[i]->GetPath() == "/usr/vork/etc/fileindex/" + name + ".conf";
        good &= configs[i]->GetLockPath() == "/tmp/fileidx_cfg_" + name + ".lock";
        good &= configs[i]->Save() && configs[i]->Load();
    }
    if (!good) {
        std::puts("a virtual call reached another function");
    }
    return good;
}

}  // namespace

int main() {
    const Folder folder;
    bool good = Check("Folder", sizeof(Folder), 3 * kText + kWord);
    good &= Check("Folder::path", OffsetIn(folder, &folder.path), kText);
    good &= Check("Folder::name", OffsetIn(folder, &folder.name), 2 * kText);
    good &= Check("Folder::document", OffsetIn(folder, &folder.document), 3 * kText);
    good &= Check("Folder::audio", OffsetIn(folder, &folder.audio), 3 * kText + 1);
    good &= Check("Folder::video", OffsetIn(folder, &folder.video), 3 * kText + 2);
    good &= Check("Folder::photo", OffsetIn(folder, &folder.photo), 3 * kText + 3);
    // The table's address, the document, its text, the lock.
    const std::size_t config = kWord + sizeof(Json::Value) + kText + kWord;
    good &= Check("Config", sizeof(Config), config) & Check("Status", sizeof(Status), config);
    good &= Check("Folders", sizeof(Folders), config + sizeof(std::map<std::string, Folder>));
    good &= CheckSlots<Config>("Config") & CheckSlots<Folders>("Folders") & CheckSlots<Status>("Status");
    return good & CheckCalls() ? 0 : 1;
}
