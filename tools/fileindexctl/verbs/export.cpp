#include "base/json/document.h"
#include "command_line/handlers.h"
#include "facts/configuration.h"
#include "facts/whole_file.h"
#include "report/text.h"

namespace VORK::FILEINDEXCTL {

ExitStatus ExportConfiguration(const Arguments &arguments, Output &output) {
    const FolderRecords folders = StoredFolders();
    const Json::Value document = DocumentOf(folders, StoredStatus());
    if (!arguments.Has("--output")) {
        output.Data() = document;
        output.Raw(FormatDocument(document));
        return ExitStatus::kDone;
    }
    const std::string file = arguments.One("--output");
    WriteWhole(file, FormatDocument(document));
    output.Data()["file"] = file;
    output.Data()["total"] = static_cast<Json::UInt64>(folders.size());
    output.Note("written to " + file);
    return ExitStatus::kDone;
}

}  // namespace VORK::FILEINDEXCTL
