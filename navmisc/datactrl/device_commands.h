// Front functions that drive the logger through the data-control process. Each sends one block;
// the answer arrives later as a reply (message 1127): a device block with the same nDeviceCmd
// and the outcome in nLastError (a KV-11 block for that family's settings and navigation
// points), preceded by progress blocks (source 1) during a read of the log.
#pragma once

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/platform/lists.h"

// Asks whether a logger is connected (a connection-status block for source 1).
void DC_KVDEVICE_QueryDeviceStatus();
// Reads the logged points into trips; the reply carries their time range.
void DC_KVDEVICE_ReadLogData();
// Erases the logger's log.
void DC_KVDEVICE_ClearLogData();
// Reads the logger's settings; the reply carries them.
void DC_KVDEVICE_ReadSetting();
// Puts the logger's settings back to their factory values.
void DC_KVDEVICE_Reset();
// Stops a running read of the log; the read then leaves no trip behind.
void DC_KVDEVICE_CancelRead();
// Sends the caller's block as it is (nDeviceCmd 4 to write the settings it carries).
void DC_KVDEVICE_WriteSetting(CDataControlCmdBlkKVDevice& config);
void DC_KVDEVICE_WriteSetting(CDataControlCmdBlkKVDevice11& config);
// Uploads navigation points: `points` holds NAVI_POINT_INFO* (navmisc/datactrl/navi_points.h).
// The first 100 items are sent; a null item leaves an empty entry at its place.
void DC_KVDEVICE_WriteNaviData(CxPtrList& points);
