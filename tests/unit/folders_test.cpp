// One indexed folder, and the store of all of them: what no line of a transcript can hold.
#include "fixture.h"

#include <string>
#include <vector>

namespace fileindex_test {
namespace {

Folder MakeFolder(const std::string &path) {
    Folder folder;
    folder.Load(path, Json::Value());
    return folder;
}

/// Looks at the document as a class derived from the store may, and as a pointer to the member lets anybody.
class Curious : public Folders {
public:
    static Json::Value &DocumentOf(Folders &store) { return store.*(&Curious::document_); }
    bool SaveAsRead() { return Load() && SaveJson(); }
};

class FoldersStore : public FileIndexTest {};

TEST_F(FoldersStore, WritesAFolderIntoAnObjectAlone) {
    Folder folder = MakeFolder("/photo/b");
    folder.name = "B";
    EXPECT_TRUE(folder.Reload("/photo/a", Parse(R"({"video":true})")));
    Json::Value object = Parse(R"({"/photo/a":"replaced","kept":1})");
    EXPECT_TRUE(folder.AddToJson(object));
    EXPECT_EQ(R"({"audio":false,"document":false,"name":"","path":"/photo/a","photo":false,"video":true})",
              Print(object["/photo/a"]));
    EXPECT_EQ(1, object["kept"].asInt());
    for (const char *text : {"[1]", "null", "\"text\""}) {
        Json::Value other = Parse(text);
        EXPECT_FALSE(folder.AddToJson(other));
        EXPECT_EQ(text, Print(other));
    }
    Json::Value out = "before";
    EXPECT_FALSE(folder.GetAdditional(out, std::string("size")));
    EXPECT_EQ("before", out);
    EXPECT_TRUE(folder.GetAdditional(out, std::string("is_valid")));
    EXPECT_EQ(Json::Value(true), out);
}

TEST_F(FoldersStore, HoldsNoFormerFullPath) {
    Folder folder = MakeFolder("/photo/a");
    EXPECT_FALSE(folder.SetPath("/none/x"));
    EXPECT_EQ("PATH", Left());
    EXPECT_EQ("", folder.GetFullPath());
    EXPECT_EQ("PATH; folder.cpp Failed to get full path from /none/x", Left());
    Given("share none /vol3/none");
    EXPECT_EQ("/vol3/none/x", folder.GetFullPath()) << "tried again at each call";
    EXPECT_TRUE(folder.SetPath("/photo/b"));
    EXPECT_EQ("/vol1/photo/b", folder.GetFullPath());
    EXPECT_FALSE(folder.Load("/gone", Json::Value()));
    EXPECT_EQ("", folder.GetFullPath());
    EXPECT_FALSE(folder.Reload("", Json::Value()));
    EXPECT_EQ("", folder.GetFullPath());
}

TEST_F(FoldersStore, KeepsNamesByteForByte) {
    const std::string bytes = "\x80 \xf0\x9f\x93\xb7 \xc3\xa4 \xff\xc3";
    GivenFolderConf(R"({"/photo/)" + bytes + R"(":{"name":")" + bytes + "\"}}");
    Folders store;
    ASSERT_TRUE(store.Load() && store.Save());
    EXPECT_EQ(R"({"/photo/)" + bytes + R"(":{"audio":false,"document":false,"name":")" + bytes +
                  R"(","path":"/photo/)" + bytes + R"(","photo":false,"video":false}})",
              FolderConf());
}

TEST_F(FoldersStore, HoldsAThousandFoldersAndNotOneMore) {
    Json::Value records;
    for (int number = 0; number < 1000; ++number) {
        records["/photo/" + std::to_string(number)] = Json::Value(Json::objectValue);
    }
    GivenFolderConf(Print(records));
    Folders store;
    Json::Value out;
    ASSERT_TRUE(store.Load());
    EXPECT_TRUE(store.Upsert(out, Parse(R"({"path":"/photo/999","audio":true})")));
    EXPECT_FALSE(store.Upsert(out, Parse(R"({"path":"/photo/1000"})")));
    EXPECT_EQ("EXCEED_MAX_FOLDER; folders.cpp Exceed max folder size", Left());
    Fail({.call = "VORKShareGet", .about = "music", .nth = 2, .times = 2});
    EXPECT_FALSE(store.Upsert(out, Parse(R"({"path":"/music"})")));
    Forget();
    EXPECT_TRUE(store.Upsert(out, Parse(R"({"path":"/photo/999","video":true})")));
    EXPECT_EQ("PATH; folder.cpp Failed to get full path from /music", Left()) << "the refused one is asked too";
    EXPECT_TRUE(store.Delete(out, "/music"));
    EXPECT_TRUE(store.Delete(out, "/photo/0") && store.Upsert(out, Parse(R"({"path":"/photo/1000"})")));
}

TEST_F(FoldersStore, IsGovernedInTheOrderOfTheList) {
    const std::vector<Folder> folders = {MakeFolder("/photo"), MakeFolder("/photo/2019")};
    EXPECT_EQ("/photo/2019", GetMostSuitableCfg(folders, "/vol1/photo/2019")["path"].asString());
    EXPECT_EQ("/photo", GetMostSuitableCfg({folders[1], folders[0]}, "/vol1/photo/2019")["path"].asString());
}

TEST_F(FoldersStore, HoldsTheDocumentThatWasLoadedAndThenTheOneSaved) {
    const std::string conf = R"({"/photo/a":{"more":1,"video":true}})";
    const std::string ordinary =
        R"({"/photo/a":{"audio":false,"document":false,"name":"","path":"/photo/a","photo":true,"video":false}})";
    for (const std::string &text : {conf, ordinary}) {
        GivenFolderConf(text + "  ");
        EXPECT_TRUE(Curious().SaveAsRead());
        EXPECT_EQ(text + "\n", ReadFile(kFolderConf));
    }
    GivenFolderConf(conf);
    Folders store;
    EXPECT_TRUE(store.Load());
    Json::Value &document = Curious::DocumentOf(store);
    EXPECT_EQ(conf, Print(document));
    document["/photo/a"]["more"] = 2;
    EXPECT_TRUE(store.SaveJson());
    EXPECT_EQ(R"({"/photo/a":{"more":2,"video":true}})", FolderConf());
    Json::Value report;
    EXPECT_TRUE(store.Upsert(report, Parse(R"({"path":"/photo/a","name":"A"})")) && store.Save());
    EXPECT_EQ(FolderConf(), Print(document));
    EXPECT_EQ("A", document["/photo/a"]["name"].asString());
}

}  // namespace
}  // namespace fileindex_test
