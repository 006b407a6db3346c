/// \file
/// Reading one member of a JSON object without conversions and without exceptions.
#ifndef FILEINDEX_JSON_ACCESS_H
#define FILEINDEX_JSON_ACCESS_H

#include <fileindex/export.h>

#include <json/value.h>

#include <string>

namespace VORK {
namespace FILEINDEX {

/// True, with `out` set, when `obj` is an object whose member `key` is a string. Anything else, a number or
/// null included, counts as missing: false, `out` as it was, nothing logged, no error code.
FILEINDEX_API bool RetrieveStringFromJsonObj(std::string &out, const std::string &key, const Json::Value &obj);

/// The same for a boolean member. The integers 0 and 1 are not booleans.
FILEINDEX_API bool RetrieveBoolFromJsonObj(bool &out, const std::string &key, const Json::Value &obj);

}  // namespace FILEINDEX
}  // namespace VORK

#endif
