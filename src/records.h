/// \file
/// The log records whose line is fixed. Module and line are a record's identity: support tools know it by them,
/// and so does fileindexctl. docs/formats.md says what each of them means.
#pragma once

namespace VORK::FILEINDEX::internal {

// Modules as the log records name them, also where a module is a folder of files.
inline constexpr char kConfigModule[] = "config.cpp";
inline constexpr char kFolderModule[] = "folder.cpp";
inline constexpr char kFoldersModule[] = "folders.cpp";
inline constexpr char kStatusModule[] = "status.cpp";
inline constexpr char kStatusMgrModule[] = "status_mgr.cpp";
inline constexpr char kIndexMgrModule[] = "index_mgr.cpp";
inline constexpr char kUtilsModule[] = "utils.cpp";

/// Where a record says that it comes from.
struct Record {
    const char *module;
    int line;
};

/// Named by the operation and the step that failed.
namespace records {

inline constexpr Record kPauseInfo = {kStatusModule, 66};
inline constexpr Record kNotifyNoSpace = {kStatusModule, 88};

inline constexpr Record kFolderStatusPath = {kStatusMgrModule, 30};
inline constexpr Record kFolderStatusOpen = {kStatusMgrModule, 37};
inline constexpr Record kFolderStatusLine = {kStatusMgrModule, 47};
inline constexpr Record kFolderStatusShare = {kStatusMgrModule, 88};
inline constexpr Record kFolderStatusQueue = {kStatusMgrModule, 100};
inline constexpr Record kStatusShare = {kStatusMgrModule, 135};
inline constexpr Record kStatusQueue = {kStatusMgrModule, 146};
inline constexpr Record kPauseSend = {kStatusMgrModule, 198};
inline constexpr Record kResumeSend = {kStatusMgrModule, 221};
inline constexpr Record kReviveSend = {kStatusMgrModule, 321};

inline constexpr Record kDeleteRequest = {kIndexMgrModule, 61};
inline constexpr Record kDeleteElement = {kIndexMgrModule, 73};
inline constexpr Record kDeleteShare = {kIndexMgrModule, 79};
inline constexpr Record kDeleteStop = {kIndexMgrModule, 89};
inline constexpr Record kDeleteSearch = {kIndexMgrModule, 94};
inline constexpr Record kDeleteRestart = {kIndexMgrModule, 96};
inline constexpr Record kDeleteSend = {kIndexMgrModule, 104};
inline constexpr Record kDeleteEvent = {kIndexMgrModule, 111};
inline constexpr Record kDeleteMonitor = {kIndexMgrModule, 121};
inline constexpr Record kDeleteClean = {kIndexMgrModule, 126};
inline constexpr Record kDeleteWithdraw = {kIndexMgrModule, 130};
inline constexpr Record kMonitorQueue = {kIndexMgrModule, 286};
inline constexpr Record kMonitorFolder = {kIndexMgrModule, 297};
inline constexpr Record kMonitorMemory = {kIndexMgrModule, 317};
inline constexpr Record kMonitorRefused = {kIndexMgrModule, 324};
inline constexpr Record kWithdrawQueue = {kIndexMgrModule, 344};
inline constexpr Record kWithdrawRefused = {kIndexMgrModule, 350};
inline constexpr Record kReindexRequest = {kIndexMgrModule, 369};
inline constexpr Record kReindexElement = {kIndexMgrModule, 377};
inline constexpr Record kReindexShare = {kIndexMgrModule, 384};
inline constexpr Record kReindexRevive = {kIndexMgrModule, 400};
inline constexpr Record kReindexPath = {kIndexMgrModule, 407};
inline constexpr Record kReindexEvent = {kIndexMgrModule, 413};
inline constexpr Record kUpdatePath = {kIndexMgrModule, 430};
inline constexpr Record kUpdateEvent = {kIndexMgrModule, 436};
inline constexpr Record kSharePauseWithdraw = {kIndexMgrModule, 484};
inline constexpr Record kShareResumeMonitor = {kIndexMgrModule, 501};
inline constexpr Record kShareRemoveStop = {kIndexMgrModule, 535};
inline constexpr Record kShareRemoveSearch = {kIndexMgrModule, 540};
inline constexpr Record kShareRemoveRestart = {kIndexMgrModule, 542};
inline constexpr Record kUpsertRequest = {kIndexMgrModule, 569};
inline constexpr Record kUpsertElement = {kIndexMgrModule, 582};
inline constexpr Record kUpsertShare = {kIndexMgrModule, 588};
inline constexpr Record kUpsertMonitor = {kIndexMgrModule, 598};
inline constexpr Record kUpsertStart = {kIndexMgrModule, 605};
inline constexpr Record kUpsertSearch = {kIndexMgrModule, 611};
inline constexpr Record kUpsertRestart = {kIndexMgrModule, 613};
inline constexpr Record kUpsertSend = {kIndexMgrModule, 621};
inline constexpr Record kUpsertPath = {kIndexMgrModule, 629};
inline constexpr Record kUpsertEvent = {kIndexMgrModule, 634};
inline constexpr Record kCleanQueue = {kIndexMgrModule, 653};
inline constexpr Record kCleanDatabase = {kIndexMgrModule, 661};

inline constexpr Record kEventDuplicates = {kUtilsModule, 95};
inline constexpr Record kRuleSharePresent = {kUtilsModule, 191};
inline constexpr Record kRuleInShare = {kUtilsModule, 239};
inline constexpr Record kRuleShareFound = {kUtilsModule, 245};
inline constexpr Record kRuleMountPoint = {kUtilsModule, 256};
inline constexpr Record kRuleRealPath = {kUtilsModule, 263};
inline constexpr Record kSpaceShare = {kUtilsModule, 361};
inline constexpr Record kEmptyPath = {kUtilsModule, 389};
inline constexpr Record kOutsideShares = {kUtilsModule, 418};
inline constexpr Record kEventPath = {kUtilsModule, 472};
inline constexpr Record kEventQueue = {kUtilsModule, 478};
inline constexpr Record kEventCut = {kUtilsModule, 502};
inline constexpr Record kEventLock = {kUtilsModule, 507};
inline constexpr Record kEventDropped = {kUtilsModule, 516};
inline constexpr Record kEventMark = {kUtilsModule, 522};
inline constexpr Record kUpgradeStop = {kUtilsModule, 641};
inline constexpr Record kUpgradeStart = {kUtilsModule, 650};
inline constexpr Record kUpgradeSearch = {kUtilsModule, 654};
inline constexpr Record kUpgradeShare = {kUtilsModule, 661};
inline constexpr Record kUpgradeMonitor = {kUtilsModule, 671};
inline constexpr Record kUpgradeReindex = {kUtilsModule, 678};
inline constexpr Record kDatabaseArgument = {kUtilsModule, 733};
inline constexpr Record kDatabaseShare = {kUtilsModule, 736};
inline constexpr Record kDatabaseMetadata = {kUtilsModule, 743};
inline constexpr Record kDatabaseMake = {kUtilsModule, 750};
inline constexpr Record kQueueArgument = {kUtilsModule, 769};
inline constexpr Record kQueueShare = {kUtilsModule, 772};
inline constexpr Record kQueueMetadata = {kUtilsModule, 779};

}  // namespace records

}  // namespace VORK::FILEINDEX::internal
