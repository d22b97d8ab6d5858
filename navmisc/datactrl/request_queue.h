// The channel to the data-control process: requests go out through the queue
// "Data_Control_Send", replies come back through "Data_Control_Recv" and reach the application's
// window as message 1127 (see docs/data-control-channel.md).
//
// The application runs ProcessCommand on a worker thread of its own with its main window (a
// CWnd whose thread runs a message loop), after clearing g_bExit; it sets g_bExit to end the
// channel. Requests may be made from any thread while the channel runs.
#pragma once

#include <atomic>
#include <cstdint>
#include <string>
#include <vector>

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/platform/cstring.h"
#include "navmisc/platform/types.h"
#include "navmisc/platform/window.h"

// A reply for the window: wParam 0, lParam the address of the reply block (a
// CDataControlCmdBlk that its nCmdType tells the class of), valid during the call only.
inline constexpr UINT WM_DATACTRL_RECEIVE = WM_USER + 103;  // 1127
// Posted by a dialog to itself when the logger reports that it is connected.
inline constexpr UINT WM_DATACTRL_READY = WM_USER + 104;  // 1128

// The command thread's stop flag, read once per pass of its loop.
extern std::atomic<bool> g_bExit;

// The command thread: makes the queues, starts the data-control process and hands its replies
// to `owner` (a CWnd*) until g_bExit is set, then stops the process and removes the queues.
// Returns 0. Without a chosen data root, or without an owner, it returns at once.
uint32_t ProcessCommand(void* owner);

// Each packs its block and sends it to the data-control process. Nothing happens while the
// channel is stopped: there is nowhere for the request to go.
void InsertRequestMessage(const CDataControlCmdBlk& block);
void InsertRequestMessage(const CDataControlExitCmdBlk& block);
void InsertRequestMessage(const CDataControlConnectionStatus& block);
void InsertRequestMessage(const CDataControlProgressCmdBlk& block);
void InsertRequestMessage(const CDataControlCmdBlkKVDevice& block);
void InsertRequestMessage(const CDataControlCmdBlkKVDevice11& block);
void InsertRequestMessage(const CDataControlCmdBlkNet& block);
void InsertRequestMessage(const CDataControlCmdBlkFile& block);

namespace navmisc::datactrl {

inline constexpr const wchar_t* kRequestQueueName = L"Data_Control_Send";
inline constexpr const wchar_t* kReplyQueueName = L"Data_Control_Recv";
inline constexpr int kQueueCapacityKiB = 2048;
inline constexpr const wchar_t* kDataControlProgram = L"GpsDataControl.exe";
// How long the command thread waits for the process to end after the exit block.
inline constexpr unsigned kExitWaitMs = 5000;

enum class ChannelState {
  kStopped,   // no queues, no process
  kRunning,   // queues made, process started, loop running: requests are accepted
  kStopping,  // g_bExit seen: exit block sent, waiting for the process, removing the queues
};
ChannelState GetChannelState();

// The command line that starts the data-control process from `folder`: the folder, one "/"
// (none when the folder ends with one), "GpsDataControl.exe", a blank and "/Dongle" for the
// where-am-I product (1000), "/Tracer" for every other.
CString DataControlCommandLine(const wchar_t* folder, GPS_APP_PROG_TYPE product);
// The program and arguments that such a command line stands for. The switch is the text after
// the last blank and the program everything before it, so a folder with blanks in its name
// stays one argument.
std::vector<std::string> DataControlArguments(const CString& commandLine);

// The process id of the data-control process the channel holds, 0 when none. After a stop in
// which the process did not end in time, the channel keeps it (and this id) until it is started
// again or EndKeptDataControlProcess is called.
int DataControlProcessId();
// Kills and reaps a data-control process that the channel kept.
void EndKeptDataControlProcess();

}  // namespace navmisc::datactrl
