/// \file
/// What the operations mean, in documents: the files, the queues' lines and the commands as they have to be.
#ifndef FILEINDEX_FUZZ_MODEL_H
#define FILEINDEX_FUZZ_MODEL_H

#include <json/value.h>

#include <map>
#include <string>
#include <utility>

namespace fileindex_fuzz {

class Model {
public:
    Json::Value folders{Json::objectValue};
    Json::Value status{Json::objectValue};

    bool Upsert(const Json::Value &request);
    bool Delete(const Json::Value &paths);
    bool Reindex(const Json::Value &paths);
    bool ShareRename(const std::string &from, const std::string &to);
    bool ShareRemove(const std::string &share);
    void SetFlag(const char *key, const std::string &share, bool set);
    void Command(const std::string &type, const char *key = nullptr, const Json::Value &value = {});

    Json::Value QueueOfShare(const std::string &share);
    Json::Value TakeCommands() { return std::exchange(commands_, Json::Value(Json::arrayValue)); }

private:
    void Event(int type, const std::string &path, const Json::Value &data);
    bool HasFolderOf(const std::string &share) const;

    std::map<std::string, Json::Value> queues_;  // by share
    Json::Value commands_{Json::arrayValue};
};

}  // namespace fileindex_fuzz

#endif
