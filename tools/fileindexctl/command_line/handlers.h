/// \file
/// The functions of the command table. Each does the whole of its command, reports through Output and throws
/// Failure (failure.h) for what stops it before anything was changed.
#pragma once

#include "command_line/arguments.h"
#include "report/exit_status.h"
#include "report/output.h"

namespace VORK::FILEINDEXCTL {

using Handler = ExitStatus(const Arguments &arguments, Output &output);

Handler ListFolders, ShowFolder;
Handler AddFolder, SetFolder, RemoveFolders;
Handler CheckPath, ContainsFolder, GoverningFolder, ExplainPath;
Handler ShowStatus, ExamineSystem, ShowMetrics;
Handler PauseIndexing, ResumeIndexing;
Handler ReindexPaths, ReviveShares;
Handler RenameShare, RemoveShare, PauseShare, ResumeShare, CleanShare;
Handler ShowMonitor, RefreshMonitors;
Handler ShowQueue, CountQueue;
Handler ExportConfiguration, ImportConfiguration, Migrate;
Handler ShowHelp, WriteManual, WriteCompletion, OfferWords;

}  // namespace VORK::FILEINDEXCTL
