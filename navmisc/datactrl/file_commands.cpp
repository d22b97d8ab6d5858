#include "navmisc/datactrl/file_commands.h"

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/datactrl/request_queue.h"

void DC_FILE_ImportFile(const wchar_t* path, int32_t appType, const wchar_t* format, COleDateTime start,
                        COleDateTime end, int32_t timeZone, const wchar_t* tripName) {
  CDataControlCmdBlkFile block;
  block.nFileCmd = DC_FILE_IMPORT;
  block.szFilePath = path ? path : L"";
  block.tPointStartTime = start;
  block.tPointEndTime = end;
  block.nTimeZone = timeZone;
  // The track record carries what the file block has no field of its own for.
  block.trackInfo.nMode = appType;
  block.trackInfo.szTrackData = format ? format : L"";
  block.trackInfo.szSubject = tripName ? tripName : L"";
  InsertRequestMessage(block);
}
