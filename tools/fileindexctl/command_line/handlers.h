/// \file
/// One function for each row of the command table. Each does the whole of its command, reports through Output and
/// throws Failure (failure.h) for what stops it before anything was changed.
#pragma once

#include "command_line/arguments.h"
#include "report/exit_status.h"
#include "report/output.h"

namespace VORK::FILEINDEXCTL {

// folders.cpp
ExitStatus ListFolders(const Arguments &arguments, Output &output);
ExitStatus ShowFolder(const Arguments &arguments, Output &output);

// folder_changes.cpp
ExitStatus AddFolder(const Arguments &arguments, Output &output);
ExitStatus SetFolder(const Arguments &arguments, Output &output);

// folder_removal.cpp
ExitStatus RemoveFolders(const Arguments &arguments, Output &output);

// questions.cpp
ExitStatus CheckPath(const Arguments &arguments, Output &output);
ExitStatus ContainsFolder(const Arguments &arguments, Output &output);
ExitStatus GoverningFolder(const Arguments &arguments, Output &output);

// explain.cpp
ExitStatus ExplainPath(const Arguments &arguments, Output &output);

// doctor/doctor.cpp
ExitStatus ExamineSystem(const Arguments &arguments, Output &output);

// status.cpp
ExitStatus ShowStatus(const Arguments &arguments, Output &output);

// schedule.cpp
ExitStatus PauseIndexing(const Arguments &arguments, Output &output);
ExitStatus ResumeIndexing(const Arguments &arguments, Output &output);

// reindex.cpp
ExitStatus ReindexPaths(const Arguments &arguments, Output &output);
ExitStatus ReviveShares(const Arguments &arguments, Output &output);

// shares.cpp
ExitStatus RenameShare(const Arguments &arguments, Output &output);
ExitStatus RemoveShare(const Arguments &arguments, Output &output);
ExitStatus PauseShare(const Arguments &arguments, Output &output);
ExitStatus ResumeShare(const Arguments &arguments, Output &output);
ExitStatus CleanShare(const Arguments &arguments, Output &output);

// monitor.cpp
ExitStatus ShowMonitor(const Arguments &arguments, Output &output);
ExitStatus RefreshMonitors(const Arguments &arguments, Output &output);

// queue_verbs.cpp
ExitStatus ShowQueue(const Arguments &arguments, Output &output);
ExitStatus CountQueue(const Arguments &arguments, Output &output);

// export.cpp
ExitStatus ExportConfiguration(const Arguments &arguments, Output &output);

// import.cpp
ExitStatus ImportConfiguration(const Arguments &arguments, Output &output);

// metrics.cpp
ExitStatus ShowMetrics(const Arguments &arguments, Output &output);

// completion.cpp
ExitStatus WriteCompletion(const Arguments &arguments, Output &output);
ExitStatus ShowHelp(const Arguments &arguments, Output &output);
ExitStatus WritePlaces(const Arguments &arguments, Output &output);

// manual.cpp
ExitStatus WriteManual(const Arguments &arguments, Output &output);

// migrate.cpp
ExitStatus Migrate(const Arguments &arguments, Output &output);

}  // namespace VORK::FILEINDEXCTL
