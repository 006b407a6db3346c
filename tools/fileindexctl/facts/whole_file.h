/// \file
/// Files that are read and written whole.
#pragma once

#include <string>

namespace VORK::FILEINDEXCTL {

/// The content of the file, or of stdin for "-". Throws Failure.
std::string ReadWhole(const std::string &path);

/// Puts the text in the place of the file, whatever happens meanwhile: the old content stands until the new one is
/// on the disk. Only for ordinary files, to which links may lead; one that is there keeps its mode. Throws
/// Failure.
void WriteWhole(const std::string &path, const std::string &text);

}  // namespace VORK::FILEINDEXCTL
