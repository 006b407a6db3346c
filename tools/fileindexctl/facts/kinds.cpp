#include "facts/kinds.h"

#include "report/folder_text.h"

#include <sys/stat.h>

#include <string_view>

namespace VORK::FILEINDEXCTL {

namespace {

// The usual extensions. fileindexd has a table of its own, which may know more of them.
constexpr struct {
    std::string_view kind;
    std::string_view plural;
    std::string_view extensions;  // each between blanks
} kKinds[] = {
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

}  // namespace

std::string KindOf(const std::string &path) {
    const auto dot = path.rfind('.');
    if (dot == std::string::npos || path.find('/', dot) != std::string::npos) {
        return kOtherKind;
    }
    std::string extension = path.substr(dot + 1);
    for (char &character : extension) {
        character = character >= 'A' && character <= 'Z' ? static_cast<char>(character - 'A' + 'a') : character;
    }
    for (const auto &row : kKinds) {
        if (extension.find(' ') == std::string::npos && !extension.empty() &&
            row.extensions.find(" " + extension + " ") != std::string_view::npos) {
            return std::string(row.kind);
        }
    }
    return kOtherKind;
}

namespace {

std::string PluralOf(const std::string &kind) {
    for (const auto &row : kKinds) {
        if (row.kind == kind) {
            return std::string(row.plural);
        }
    }
    return kind;
}

}  // namespace

std::string ObstacleOfKind(const std::string &path, const Json::Value &record, std::string &kind) {
    struct stat status {};
    const std::string folder = record["path"].asString();
    if (stat(path.c_str(), &status) == 0 && S_ISREG(status.st_mode)) {
        kind = KindOf(path);
    }
    if (MediaText(record) == "none") {
        return "no kind of file is on in " + folder;
    }
    const bool isOff = record.isMember(kind) && !record[kind].asBool();
    return isOff ? PluralOf(kind) + " are off in " + folder : std::string();
}

}  // namespace VORK::FILEINDEXCTL
