#include "base/json/document.h"

#include "base/json/text.h"

#include <json/reader.h>
#include <json/writer.h>

#include <memory>

namespace VORK {

std::optional<Json::Value> ParseStrictly(std::string_view text, std::string *problems) try {
    Json::CharReaderBuilder builder;
    Json::CharReaderBuilder::strictMode(&builder.settings_);
    builder["stackLimit"] = kMaxJsonDepth;
    const std::unique_ptr<Json::CharReader> reader(builder.newCharReader());
    Json::Value document;
    return reader->parse(text.data(), text.data() + text.size(), &document, problems) ? std::optional(document)
                                                                                      : std::nullopt;
} catch (const Json::Exception &) {
    return std::nullopt;
}

std::optional<Json::Value> ParseObject(std::string_view text) {
    std::optional<Json::Value> document = ParseStrictly(text);
    return document && document->isObject() ? std::move(document) : std::nullopt;
}

std::string FormatDocument(const Json::Value &document, const char *indentation) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = indentation;
    builder["emitUTF8"] = true;
    return Json::writeString(builder, document) + "\n";
}

}  // namespace VORK
