#include "facts/kinds.h"

#include "report/folder_text.h"

#include <sys/stat.h>

#include <algorithm>
#include <iterator>
#include <string_view>

namespace VORK::FILEINDEXCTL {

namespace {

// The usual extensions. fileindexd has a table of its own, which may know more of them.
struct Kind {
    const char *name;
    const char *plural;
    std::string_view extensions;  // each between blanks
};

constexpr Kind kKinds[] = {
    {"document", "documents",
     " csv doc docm docx dot dotx epub htm html key md mobi numbers odp ods odt ott pages pdf pps ppsx ppt pptx "
     "rtf "
     "tex txt xls xlsm xlsx xml "},
    {"audio", "audio files",
     " aac aif aiff alac amr ape dff dsf flac m4a m4b mid midi mka mp2 mp3 oga ogg opus wav wma "},
    {"video", "videos",
     " 3g2 3gp asf avi divx f4v flv m2t m2ts m2v m4v mkv mov mp4 mpe mpeg mpg mts ogv rm rmvb ts vob webm wmv "},
    {"photo", "photos",
     " arw avif bmp cr2 cr3 dng gif heic heif jpe jpeg jpg nef nrw orf pef png raf raw rw2 sr2 srw svg tif tiff "
     "webp "},
};

std::string ExtensionOf(const std::string &path) {
    const auto dot = path.rfind('.');
    std::string extension = dot == std::string::npos ? "" : path.substr(dot + 1);
    for (char &character : extension) {
        character = character >= 'A' && character <= 'Z' ? static_cast<char>(character - 'A' + 'a') : character;
    }
    return extension;
}

// Null for a file of none of them.
const Kind *KindOf(const std::string &path) {
    const std::string extension = ExtensionOf(path);
    if (extension.empty() || extension.find_first_of(" /") != std::string::npos) {
        return nullptr;
    }
    const auto *kind = std::find_if(std::begin(kKinds), std::end(kKinds), [&](const Kind &row) {
        return row.extensions.find(" " + extension + " ") != std::string_view::npos;
    });
    return kind == std::end(kKinds) ? nullptr : kind;
}

}  // namespace

std::string ObstacleOfKind(const std::string &path, const Json::Value &record, std::string &kind) {
    struct stat status {};
    const Kind *found = nullptr;
    if (stat(path.c_str(), &status) == 0 && S_ISREG(status.st_mode)) {
        found = KindOf(path);
        kind = found == nullptr ? kOtherKind : found->name;
    }
    const std::string folder = record["path"].asString();
    if (MediaText(record) == "none") {
        return "no kind of file is on in " + folder;
    }
    const bool isOff = found != nullptr && record.isMember(found->name) && !record[found->name].asBool();
    return isOff ? found->plural + (" are off in " + folder) : "";
}

}  // namespace VORK::FILEINDEXCTL
