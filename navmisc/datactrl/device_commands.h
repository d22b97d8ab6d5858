// Front functions that ask the data-control process about the logger. Each sends one block;
// the answer arrives later as a reply (message 1127).
#pragma once

// Asks whether a logger is connected (a connection-status block for source 1).
void DC_KVDEVICE_QueryDeviceStatus();
// Erases the logger's log (a fresh device block with command 2).
void DC_KVDEVICE_ClearLogData();
