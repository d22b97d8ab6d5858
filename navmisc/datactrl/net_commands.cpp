#include "navmisc/datactrl/net_commands.h"

#include "navmisc/datactrl/cmd_blocks.h"
#include "navmisc/datactrl/request_queue.h"

void DC_NET_QueryNetStatus() {
  CDataControlConnectionStatus status{};
  status.nCmdType = DC_CMD_CONNECTION_STATUS;
  status.nSource = DC_SOURCE_NET;
  InsertRequestMessage(status);
}
