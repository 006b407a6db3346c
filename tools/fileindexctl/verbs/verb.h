/// \file
/// What nearly every verb is written with.
#pragma once

#include "command_line/handlers.h"
#include "facts/paths.h"
#include "report/failure.h"
#include "report/text.h"

#include <fileindex/folders.h>
#include <fileindex/index_mgr.h>
#include <fileindex/status_mgr.h>

#include <algorithm>
#include <set>
#include <string>
#include <vector>

namespace VORK::FILEINDEXCTL {

using FILEINDEX::Folder;
using FILEINDEX::IndexMgr;
using FILEINDEX::StatusMgr;

}  // namespace VORK::FILEINDEXCTL
