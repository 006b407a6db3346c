// One indexed folder, and the store of all of them.
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

class FolderOfConf : public FileIndexTest {
protected:
    void SetUp() override {
        FileIndexTest::SetUp();
        GivenShare("photo");
        GivenShare("music", "/vol2/music");
    }
};
class FoldersStore : public FolderOfConf {};

TEST_F(FolderOfConf, IsWrittenIntoAnObjectAlone) {
    Folder folder = MakeFolder("/photo/b");
    folder.name = "B";
    EXPECT_TRUE(folder.Reload("/photo/a", Parse(R"({"video":true})")));
    const Json::Value record = folder.asJson();
    EXPECT_EQ(R"({"audio":false,"document":false,"name":"","path":"/photo/a","photo":false,"video":true})",
              Print(record));
    Json::Value object = Parse(R"({"/photo/a":"replaced","kept":1})");
    EXPECT_TRUE(folder.AddToJson(object));
    EXPECT_EQ(R"({"/photo/a":)" + Print(record) + R"(,"kept":1})", Print(object));
    for (const char *text : {"[1]", "null", "\"text\""}) {
        Json::Value other = Parse(text);
        EXPECT_FALSE(folder.AddToJson(other));
        EXPECT_EQ(text, Print(other));
    }
    EXPECT_EQ("", Left());
}

TEST_F(FolderOfConf, GivesOneAdditionalFact) {
    Json::Value out = "before";
    EXPECT_FALSE(MakeFolder("/photo").GetAdditional(out, std::string("size")));
    EXPECT_EQ("before", out);
    EXPECT_TRUE(MakeFolder("/photo").GetAdditional(out, std::string("is_valid")));
    EXPECT_EQ(Json::Value(true), out);
}

TEST_F(FolderOfConf, ForgetsItsFormerFullPath) {
    Folder folder = MakeFolder("/photo/a");
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

TEST_F(FoldersStore, KeepsNamesByteForByte) {
    const std::string bytes = "\x80 \xf0\x9f\x93\xb7 \xc3\xa4 \xff\xc3";
    GivenFolderConf(R"({"/photo/)" + bytes + R"(":{"name":")" + bytes + "\"}}");
    Folders store;
    ASSERT_TRUE(store.Load() && store.Save());
    EXPECT_EQ(R"({"/photo/)" + bytes + R"(":{"audio":false,"document":false,"name":")" + bytes +
                  R"(","path":"/photo/)" + bytes + R"(","photo":false,"video":false}})",
              FolderConf());
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
    const std::string ordinary =
        R"({"/photo/a":{"audio":false,"document":false,"name":"","path":"/photo/a","photo":true,"video":false}})";
    GivenFolderConf(ordinary + "  ");
    EXPECT_TRUE(SavesItsDocument().SaveAsRead());
    EXPECT_EQ(ordinary + "\n", ReadFile(kFolderConf));
}

TEST_F(FoldersStore, HoldsAThousandFoldersAndNotOneMore) {
    std::string records;
    for (int number = 0; number < 1000; ++number) {
        records += (number > 0 ? ",\"/photo/" : "\"/photo/") + std::to_string(number) + "\":{}";
    }
    GivenFolderConf("{" + records + "}");
    Folders store;
    Json::Value out;
    ASSERT_TRUE(store.Load());
    EXPECT_TRUE(store.Upsert(out, Parse(R"({"path":"/photo/999","audio":true})")));
    EXPECT_FALSE(store.Upsert(out, Parse(R"({"path":"/photo/1000"})")));
    EXPECT_EQ("5 folders.cpp Exceed max folder size", Left());
    Fail({.call = "VORKShareGet", .about = "music", .nth = 2, .times = 2});
    EXPECT_FALSE(store.Upsert(out, Parse(R"({"path":"/music"})")));
    Forget();
    EXPECT_TRUE(store.Upsert(out, Parse(R"({"path":"/photo/999","video":true})")));
    EXPECT_EQ("2 folder.cpp Failed to get full path from /music", Left()) << "the refused one is asked too";
    EXPECT_TRUE(store.Delete(out, "/music"));
    EXPECT_TRUE(store.Delete(out, "/photo/0") && store.Upsert(out, Parse(R"({"path":"/photo/1000"})")));
}

TEST_F(FoldersStore, AreGovernedInTheOrderOfTheList) {
    const std::vector<Folder> folders = {MakeFolder("/photo"), MakeFolder("/photo/2019")};
    EXPECT_EQ("/photo/2019", GetMostSuitableCfg(folders, "/vol1/photo/2019")["path"].asString());
    EXPECT_EQ("/photo", GetMostSuitableCfg({folders[1], folders[0]}, "/vol1/photo/2019")["path"].asString());
}

/// Looks at the document as a class derived from the store may, and as a pointer to the member lets anybody.
class Curious : public Folders {
public:
    static Json::Value &DocumentOf(Folders &store) { return store.*(&Curious::document_); }
};

TEST_F(FoldersStore, HoldsTheDocumentThatWasLoadedAndThenTheOneSaved) {
    GivenFolderConf(R"({"/photo/a":{"more":1,"video":true}})");
    Folders store;
    EXPECT_TRUE(store.Load());
    Json::Value &document = Curious::DocumentOf(store);
    EXPECT_EQ(R"({"/photo/a":{"more":1,"video":true}})", Print(document));

    document["/photo/a"]["more"] = 2;
    EXPECT_TRUE(store.SaveJson());
    EXPECT_EQ(R"({"/photo/a":{"more":2,"video":true}})", FolderConf());

    Json::Value report;
    EXPECT_TRUE(store.Upsert(report, Parse(R"({"path":"/photo/a","name":"A"})")));
    EXPECT_TRUE(store.Save());
    EXPECT_EQ(FolderConf(), Print(document));
    EXPECT_EQ(R"({"audio":false,"document":false,"name":"A","path":"/photo/a","photo":false,"video":true})",
              Print(document["/photo/a"]));
}

}  // namespace
}  // namespace fileindex_test
