// Web-service commands (kind 2). The web-service work plugs in here: give a command its
// function and call it from RunNetCommand; the reply is the request's block as the function
// leaves it, with the code it returns in nLastError.
#include "handlers.h"
#include "navmisc/datactrl/dc_errors.h"

namespace gpsdc {
namespace {

int32_t RunNetCommand(CDataControlCmdBlkNet& block, RequestContext& /*ctx*/) {
  switch (block.nNetCmd) {
    case 1: case 2: case 3: case 4: case 5: case 6: case 7: case 8: case 9: case 10:
    case 11: case 12: case 13: case 14: case 15: case 16: case 20: case 21: case 25: case 26:
      return DC_ERR_NOT_AVAILABLE;
    default:
      return DC_ERR_UNKNOWN_COMMAND;
  }
}

}  // namespace

bool WebServiceConnected(const Config& config) {
  const std::wstring& url = config.serviceUrl.str();
  return url.starts_with(L"http://") || url.starts_with(L"https://");
}

void RegisterNetHandlers(HandlerTable& table) {
  table.Set(DC_CMD_NET, [](RequestContext& ctx) {
    CDataControlCmdBlkNet net;
    AnswerInPlace(ctx, net, RunNetCommand);
  });
}

}  // namespace gpsdc
