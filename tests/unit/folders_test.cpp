// One indexed folder, and the store of all of them.
#include "fixture.h"

#include <string>
#include <vector>

namespace fileindex_test {
namespace {

const std::string kNothing = R"({"audio":false,"document":false,"photo":false,"video":false})";
const std::string kEverything = R"({"audio":true,"document":true,"photo":true,"video":true})";

/// The flags that are set, as letters of "davp".
std::string Flags(const Folder &folder) {
    std::string flags;
    flags += folder.document ? "d" : "";
    flags += folder.audio ? "a" : "";
    flags += folder.video ? "v" : "";
    flags += folder.photo ? "p" : "";
    return flags;
}

Folder MakeFolder(const std::string &path, const std::string &flags) {
    Folder folder;
    folder.Load(path, Parse("{" + FolderRecord(path, "", flags) + "}")[path]);
    return folder;
}

std::vector<std::string> PathsOf(const std::vector<Folder> &folders) {
    std::vector<std::string> paths;
    paths.reserve(folders.size());
    for (const Folder &folder : folders) {
        paths.push_back(folder.path);
    }
    return paths;
}

class FolderOfConf : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
    }
};
class FoldersStore : public FolderOfConf {
protected:
    /// Upserts into the loaded store and saves it if that worked; the change report, or "refused".
    static std::string UpsertAndSave(const std::string &folder) {
        Folders store;
        EXPECT_TRUE(store.Load());
        Json::Value out;
        return store.Upsert(out, Parse(folder)) && store.Save() ? Print(out) : "refused";
    }
};
class GoverningFolder : public FolderOfConf {};

TEST_F(FolderOfConf, TakesFromARecordWhatHasTheRightType) {
    Folder folder;
    EXPECT_TRUE(folder.Load("/photo/a", Parse(R"({"path":"/other","name":"A","document":true,"photo":true})")));
    EXPECT_EQ("/photo/a A dp", folder.path + " " + folder.name + " " + Flags(folder));
    EXPECT_EQ("/vol1/photo/a", folder.GetFullPath());

    EXPECT_TRUE(folder.Load("/music", Parse(R"({"name":5,"audio":true,"photo":1,"document":null})")));
    EXPECT_EQ("/music A dap", folder.path + " " + folder.name + " " + Flags(folder));
    EXPECT_EQ("/vol2/music", folder.GetFullPath());
    for (const char *record : {"[]", "7", "null", "\"text\""}) {
        EXPECT_TRUE(folder.Load("/music", Parse(record)));
        EXPECT_EQ("A dap", folder.name + " " + Flags(folder)) << record;
    }

    EXPECT_TRUE(folder.Reload("/photo/b", Parse(R"({"video":true})")));
    EXPECT_EQ("/photo/b  v", folder.path + " " + folder.name + " " + Flags(folder));
    EXPECT_EQ("", Left());
}

TEST_F(FolderOfConf, IsWrittenAsSixMembersAndNoMore) {
    const Folder folder = MakeFolder("/photo/a", "vp");
    EXPECT_EQ("{" + FolderRecord("/photo/a", "", "vp") + "}", R"({"/photo/a":)" + Print(folder.asJson()) + "}");

    Json::Value object = Parse(R"({"/photo/a":"replaced","kept":1})");
    EXPECT_TRUE(folder.AddToJson(object));
    EXPECT_EQ(Parse("{" + FolderRecord("/photo/a", "", "vp") + R"(,"kept":1})"), object);
    for (const char *text : {"[1]", "null", "\"text\""}) {
        Json::Value other = Parse(text);
        EXPECT_FALSE(folder.AddToJson(other));
        EXPECT_EQ(text, Print(other));
    }
    EXPECT_EQ("", Left());
}

TEST_F(FolderOfConf, ForgetsItsFormerFullPath) {
    Folder folder = MakeFolder("/photo/a", "d");
    EXPECT_FALSE(folder.SetPath("/none/x"));
    EXPECT_EQ("2", Left());
    EXPECT_EQ("", folder.GetFullPath());
    EXPECT_EQ("2 folder.cpp Failed to get full path from /none/x", Left());

    Platform::Current().shares["none"].path = "/vol3/none";
    EXPECT_EQ("/vol3/none/x", folder.GetFullPath()) << "tried again at each call";
    EXPECT_TRUE(folder.SetPath("/photo/b"));
    EXPECT_EQ("/vol1/photo/b", folder.GetFullPath());
    EXPECT_FALSE(folder.Load("/gone", Json::Value()));
    EXPECT_EQ("", folder.GetFullPath());
    EXPECT_FALSE(folder.Reload("", Json::Value()));
    EXPECT_EQ("", folder.GetFullPath());
}

TEST_F(FoldersStore, LoadsWhatIsThereUnderTheNamesOfTheMembers) {
    GivenFolderConf(R"({"/photo/b":{"path":"/else","name":"B","audio":true,"later":[]},
                        "/photo":5, "/none/x":{"video":true}, "":{}, "/Photo":{"photo":"yes"}})");
    std::vector<Folder> folders;
    ASSERT_TRUE(IndexMgr::List(folders));
    EXPECT_THAT(PathsOf(folders), ElementsAre("", "/Photo", "/none/x", "/photo", "/photo/b"));
    EXPECT_EQ("v", Flags(folders[2]));
    EXPECT_EQ("B a", folders[4].name + " " + Flags(folders[4]));

    Folders store;
    ASSERT_TRUE(store.Load());
    ASSERT_TRUE(store.Save());
    EXPECT_EQ(Canonical("{" + FolderRecord("", "", "") + "," + FolderRecord("/Photo", "", "") + "," +
                        FolderRecord("/none/x", "", "v") + "," + FolderRecord("/photo", "", "") + "," +
                        FolderRecord("/photo/b", "B", "a") + "}"),
              FolderConf());
}

TEST_F(FoldersStore, TakesTheLastOfRepeatedMembersInAnyOrder) {
    const std::pair<const char *, std::string> rows[] = {
        {R"({"/photo/a":{"photo":true},"/photo/a":{"document":true}})", FolderRecord("/photo/a", "", "d")},
        {R"({"/photo/a":{"photo":true},"/photo/\u0061":{"audio":true}})", FolderRecord("/photo/a", "", "a")},
        {R"({"/photo/a":{"name":"first","name":"last"}})", FolderRecord("/photo/a", "last", "")},
        {R"({"/photo/a":{"photo":true,"photo":5,"name":"x","name":7}})", FolderRecord("/photo/a", "", "")},
        {R"({"/photo/b":{},"/photo/a":{"video":true}})",
         FolderRecord("/photo/a", "", "v") + "," + FolderRecord("/photo/b", "", "")},
    };
    for (const auto &[conf, records] : rows) {
        GivenFolderConf(conf);
        Folders store;
        ASSERT_TRUE(store.Load() && store.Save());
        EXPECT_EQ("{" + records + "}", FolderConf()) << conf;
    }
}

TEST_F(FoldersStore, KeepsNamesByteForByteAndEscapedOnes) {
    const std::string bytes = "\x80 \xf0\x9f\x93\xb7 \xc3\xa4 \xff\xc3";
    const std::string escaped = R"(\u00e4\ud83d\ude00 \u0000\u0001\u001f\u007f \"\\\/\b\f\n\r\t)";
    for (const std::string &name : {bytes, escaped}) {
        GivenFolders({FolderRecord("/photo/" + name, name, "p")});
        const std::string conf = FolderConf();
        Folders store;
        ASSERT_TRUE(store.Load());
        ASSERT_TRUE(store.Save());
        EXPECT_EQ(conf, FolderConf());
    }
}

/// As a subclass may: without the folders.
class SavesItsDocument : public Folders {
public:
    bool SaveAsRead() { return Load() && SaveJson(); }
};

TEST_F(FoldersStore, SavesWhatItHasReadForASubclass) {
    const std::string conf = R"({"/photo/a":{"later":[1],"photo":true}})";
    GivenFolderConf(conf + "  ");
    EXPECT_TRUE(SavesItsDocument().SaveAsRead());
    EXPECT_EQ(conf, FolderConf());
    const std::string ordinary = "{" + FolderRecord("/photo/a", "", "p") + "}";
    GivenFolderConf(ordinary + "  ");
    EXPECT_TRUE(SavesItsDocument().SaveAsRead());
    EXPECT_EQ(ordinary + "\n", ReadFile(kFolderConf));
}

TEST_F(FoldersStore, RefusesADocumentThatIsNoObject) {
    for (const char *text : {"[]", R"("text")", "5", "null", "true"}) {
        GivenFolderConf(text);
        EXPECT_FALSE(Folders().Load());
        EXPECT_EQ(std::string("8 folders.cpp Malformed folders: ") + text, Left());
    }
    GivenFolderConf("{");
    EXPECT_FALSE(Folders().Load());
    EXPECT_EQ(kFolderConfUnreadable, Left());
}

TEST_F(FoldersStore, WithoutAFileIsEmpty) {
    Folders store;
    EXPECT_TRUE(store.Load());
    std::vector<Folder> folders(1);
    EXPECT_TRUE(store.List(folders));
    EXPECT_THAT(folders, IsEmpty());
    Json::Value out = "before";
    EXPECT_FALSE(store.Get(out, "/photo"));
    EXPECT_EQ("before", out);
    EXPECT_EQ("4 folders.cpp No such folder: /photo", Left());
    EXPECT_TRUE(store.Save());
    EXPECT_EQ("{}", FolderConf());
}

TEST_F(FoldersStore, ListsInByteOrderAndByExactShare) {
    GivenFolders({FolderRecord("/photo/z", "", ""), FolderRecord("/photo", "", ""),
                  FolderRecord("/Photo/a", "", ""), FolderRecord("/photo\xff", "", ""),
                  FolderRecord("/photos/a", "", ""), FolderRecord("/none", "", "")});
    Folders store;
    ASSERT_TRUE(store.Load());
    std::vector<Folder> folders;
    EXPECT_TRUE(store.List(folders));
    EXPECT_THAT(PathsOf(folders),
                ElementsAre("/Photo/a", "/none", "/photo", "/photo/z", "/photos/a", "/photo\xff"));
    EXPECT_TRUE(store.List(folders, "photo"));
    EXPECT_THAT(PathsOf(folders), ElementsAre("/photo", "/photo/z"));
    EXPECT_TRUE(store.List(folders, "nobody"));
    EXPECT_THAT(folders, IsEmpty());
    EXPECT_TRUE(store.List(folders, ""));
    EXPECT_EQ(6U, folders.size());
}

TEST_F(FoldersStore, UpsertReportsWhatChangesForThePath) {
    GivenFolders({FolderRecord("/photo", "All", "da"), FolderRecord("/photo/2015", "Holiday", "vp")});
    const struct {
        const char *name;
        std::string folder, report, record;
    } rows[] = {
        {"a new folder that none covers", R"({"path":"/music","name":"M","audio":true})", kEverything,
         FolderRecord("/music", "M", "a")},
        {"a new folder under another", R"({"path":"/photo/x","document":true,"photo":true})",
         R"({"audio":true,"document":false,"photo":true,"video":false})", FolderRecord("/photo/x", "", "dp")},
        {"two members of a known folder", R"({"path":"/photo/2015","video":false,"audio":true})",
         R"({"audio":true,"document":false,"photo":false,"video":true})",
         FolderRecord("/photo/2015", "Holiday", "ap")},
        {"a member of the wrong type", R"({"path":"/photo","audio":0,"name":"Every"})", kNothing,
         FolderRecord("/photo", "Every", "da")},
        {"the same again", R"({"path":"/music","audio":true})", kNothing, FolderRecord("/music", "M", "a")},
        {"a path that differs by a slash", R"({"path":"/music/","audio":true})", kNothing,
         FolderRecord("/music/", "", "a")},
    };
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        EXPECT_EQ(row.report, UpsertAndSave(row.folder));
        EXPECT_NE(std::string::npos, FolderConf().find(row.record)) << FolderConf();
    }
    EXPECT_EQ(5U, Parse(FolderConf()).size());
    EXPECT_EQ("", Left());
}

TEST_F(FoldersStore, UpsertOfABadParameterLeavesTheFileAlone) {
    const std::string conf = "{" + FolderRecord("/photo", "All", "da") + "}  ";
    GivenFolderConf(conf);
    for (const char *folder : {R"({"path":"/none/x"})", R"({"path":""})", R"({"path":5})", R"({"name":"x"})", "{}",
                               "[]", "5", "null", R"("/photo/x")"}) {
        EXPECT_EQ("refused", UpsertAndSave(folder));
        const std::string left = Left();
        EXPECT_TRUE(left.starts_with("1 ") && left.ends_with(std::string("folders.cpp Bad param: ") + folder))
            << left;
        EXPECT_EQ(conf, ReadFile(kFolderConf));
    }
}

TEST_F(FoldersStore, HoldsAThousandFoldersAndNotOneMore) {
    std::vector<std::string> records;
    records.reserve(1000);
    for (int number = 0; number < 1000; ++number) {
        records.push_back(FolderRecord("/photo/" + std::to_string(number), "", "d"));
    }
    GivenFolders(records);
    EXPECT_NE("refused", UpsertAndSave(R"({"path":"/photo/999","audio":true})"));
    const std::string conf = ReadFile(kFolderConf);
    EXPECT_EQ("refused", UpsertAndSave(R"({"path":"/photo/1000"})"));
    EXPECT_EQ("5 folders.cpp Exceed max folder size", Left());
    EXPECT_EQ(conf, ReadFile(kFolderConf));

    Folders store;
    Json::Value out;
    ASSERT_TRUE(store.Load());
    Fail({.call = "VORKShareGet", .about = "music", .nth = 2, .times = 2});
    EXPECT_FALSE(store.Upsert(out, Parse(R"({"path":"/music"})")));
    Forget();
    EXPECT_TRUE(store.Upsert(out, Parse(R"({"path":"/photo/999","video":true})")));
    EXPECT_EQ("2 folder.cpp Failed to get full path from /music", Left()) << "the refused one is asked too";
    EXPECT_TRUE(store.Delete(out, "/music"));
    EXPECT_TRUE(store.Delete(out, "/photo/0") && store.Upsert(out, Parse(R"({"path":"/photo/1000"})")));
}

TEST_F(FoldersStore, DeleteReportsUnderThePathWhatChangesForIt) {
    GivenFolders({FolderRecord("/music", "", "a"), FolderRecord("/none/x", "", "d"),
                  FolderRecord("/photo", "", "da"), FolderRecord("/photo/2015", "", "vp")});
    const struct {
        const char *name, *path;
        std::string out;
        size_t left;
    } rows[] = {
        {"covered by another", "/photo/2015", R"({"/photo/2015":)" + kEverything + "}", 3},
        {"not stored, covered", "/photo/x", R"({"/photo/x":)" + kNothing + "}", 3},
        {"covered by none", "/music", R"({"/music":)" + kEverything + "}", 2},
        {"not stored, covered by none", "/music", R"({"/music":)" + kEverything + "}", 2},
        {"of a share that is gone", "/none/x", "\"before\"", 1},
        {"an empty path", "", "\"before\"", 1},
    };
    Folders store;
    ASSERT_TRUE(store.Load());
    for (const auto &row : rows) {
        SCOPED_TRACE(row.name);
        Json::Value out = "before";
        EXPECT_TRUE(store.Delete(out, row.path));
        EXPECT_EQ(row.out, Print(out));
        std::vector<Folder> folders;
        store.List(folders);
        EXPECT_EQ(row.left, folders.size());
    }
    Json::Value out;
    Forget();
    EXPECT_TRUE(store.Delete(out, "/none/x"));
    EXPECT_EQ("2", Left());
}

TEST_F(GoverningFolder, IsTheLastOfTheListThatCoversThePath) {
    const std::vector<Folder> folders = {MakeFolder("/photo/2019", "v"), MakeFolder("/photo", "d"),
                                         MakeFolder("/none", "a"), MakeFolder("/music/", "p")};
    const struct {
        const char *path, *governor;
    } rows[] = {
        {"/vol1/photo/2019/x", "/photo"},
        {"/vol1/photo/2019", "/photo"},
        {"/vol1/photo", "/photo"},
        {"/vol1/photos", ""},
        {"/vol1/Photo/x", ""},
        {"/vol1", ""},
        {"", ""},
        {"/", ""},
        {"/vol2/music/x", ""},
        {"/vol2/music//x", "/music/"},
        {"/vol2/music/", "/music/"},
        {"/vol2/music", ""},
    };
    for (const auto &row : rows) {
        const Json::Value governor = GetMostSuitableCfg(folders, row.path);
        EXPECT_EQ(*row.governor != '\0' ? 6U : 0U, governor.size()) << row.path;
        EXPECT_TRUE(governor.isObject());
        EXPECT_EQ(row.governor, governor.get("path", "").asString()) << row.path;
    }
    EXPECT_EQ("/photo/2019", GetMostSuitableCfg({folders[1], folders[0]}, "/vol1/photo/2019")["path"].asString());
    EXPECT_EQ("{}", Print(GetMostSuitableCfg({}, "/vol1/photo")));
}

}  // namespace
}  // namespace fileindex_test
