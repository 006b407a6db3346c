#include "command_line/handlers.h"
#include "facts/configuration.h"
#include "facts/whole_file.h"
#include "report/text.h"

#include <json/writer.h>

namespace VORK::FILEINDEXCTL {

namespace {

std::string Serialise(const Json::Value &document) {
    Json::StreamWriterBuilder builder;
    builder["indentation"] = "  ";
    builder["emitUTF8"] = true;  // names are bytes and stay what they are
    return Json::writeString(builder, document);
}

}  // namespace

ExitStatus ExportConfiguration(const Arguments &arguments, Output &output) {
    const FolderRecords folders = StoredFolders();
    const Json::Value document = DocumentOf(folders, StoredStatus());
    if (!arguments.Has("--output")) {
        output.Data() = document;
        output.Raw(Serialise(document) + "\n");
        return ExitStatus::kDone;
    }
    const std::string file = arguments.One("--output");
    WriteWhole(file, Serialise(document) + "\n");
    output.Data()["file"] = file;
    output.Data()["total"] = static_cast<Json::UInt64>(folders.size());
    output.Note("written to " + file);
    return ExitStatus::kDone;
}

}  // namespace VORK::FILEINDEXCTL
