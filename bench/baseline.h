/// \file
/// The straightforward implementation of each hot operation: what the library is measured against. Results are the
/// library's, cost is not.
#pragma once

#include <fileindex/folder.h>

#include <json/value.h>

#include <map>
#include <string>
#include <vector>

namespace baseline {

using FolderMap = std::map<std::string, VORK::FILEINDEX::Folder>;

/// Stream-parses folder.conf into a document and that into a map.
FolderMap Load();

/// Copies the list, then asks it.
bool IsPathIndexed(const std::string &path);

/// Builds the document record by record and streams it over the truncated file.
void Save(const FolderMap &folders);

/// Copies the list for each record.
Json::Value Upsert(FolderMap &folders, const Json::Value &record);

/// Copies of all records, sorted, as a page.
Json::Value List(const FolderMap &folders, unsigned long offset, unsigned long limit);

/// getline, and a reader for each line.
bool IsReindexQueued(const std::string &fullPath, const std::string &queueFile);
bool IsPathInQueue(const std::string &fullPath, const std::string &queueFile);

/// The duplicate check as above, then an append under the queue's lock.
bool AddEvent(int type, const std::string &fullPath, const std::string &queueFile);

/// A writer for each command.
bool SendCommand(const std::string &command, const Json::Value &data);

}  // namespace baseline
