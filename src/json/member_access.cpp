#include <fileindex/json_access.h>

namespace VORK {
namespace FILEINDEX {

namespace {

const Json::Value *MemberOf(const Json::Value &obj, const std::string &key) {
    return obj.isObject() ? obj.find(key.data(), key.data() + key.size()) : nullptr;
}

}  // namespace

bool RetrieveStringFromJsonObj(std::string &out, const std::string &key, const Json::Value &obj) {
    const Json::Value *member = MemberOf(obj, key);
    if (member == nullptr || !member->isString()) {
        return false;
    }
    out = member->asString();
    return true;
}

bool RetrieveBoolFromJsonObj(bool &out, const std::string &key, const Json::Value &obj) {
    const Json::Value *member = MemberOf(obj, key);
    if (member == nullptr || !member->isBool()) {
        return false;
    }
    out = member->asBool();
    return true;
}

}  // namespace FILEINDEX
}  // namespace VORK
