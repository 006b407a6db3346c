#include "json/text.h"

#include <json/writer.h>

#include <exception>

namespace VORK::FILEINDEX::internal {

namespace {

// Deeper documents have no use here, and a hostile one must not exhaust the stack.
constexpr unsigned kMaxDepth = 256;

std::unique_ptr<Json::CharReader> NewReader() {
    Json::CharReaderBuilder builder;
    builder["collectComments"] = false;
    builder["allowComments"] = false;
    builder["allowTrailingCommas"] = false;
    builder["strictRoot"] = false;  // a lone number or string is valid JSON
    builder["failIfExtra"] = true;
    builder["rejectDupKeys"] = false;
    builder["stackLimit"] = kMaxDepth;
    return std::unique_ptr<Json::CharReader>(builder.newCharReader());
}

}  // namespace

JsonReader::JsonReader() : reader_(NewReader()) {}

bool JsonReader::Parse(std::string_view text, Json::Value &out) const {
    try {
        return reader_->parse(text.data(), text.data() + text.size(), &out, nullptr);
    } catch (const std::exception &) {
        return false;  // too deep, or a number beyond every range
    }
}

std::string ToString(const Json::Value &value) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "";
    builder["commentStyle"] = "None";
    builder["emitUTF8"] = true;
    return Json::writeString(builder, value);
}

}  // namespace VORK::FILEINDEX::internal
