// The texts by which the suite names the connected logger: its model's display name and a
// normalised form of the identity it reports (serial number or modem identity).
#pragma once

#include "navmisc/platform/cstring.h"

// The display name of the connected logger's model (g_wDeviceModelID; for model 8 the firmware
// version g_dDeviceVersion decides between "KV-7" and "KV-7P"). Empty for a model it does not
// know.
CString GetCurrentModelDspName();

// Rewrites an identity text as the logger reports it ("M:0001-SN: 123", "M:0018-IMEI:3567...")
// into "SN:" + two-digit model code + number, in upper case. A text without a known model
// prefix is only turned to upper case.
void ChangeModelDspName(CString& identity);
