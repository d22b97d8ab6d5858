// File commands (kind 3). The import work plugs in here: give a command its function and call
// it from RunFileCommand; the reply is the request's block as the function leaves it, with the
// code it returns in nLastError.
#include "handlers.h"
#include "navmisc/datactrl/dc_errors.h"

namespace gpsdc {
namespace {

int32_t RunFileCommand(CDataControlCmdBlkFile& block, RequestContext& /*ctx*/) {
  switch (block.nFileCmd) {
    case DC_FILE_IMPORT:
      return DC_ERR_NOT_AVAILABLE;
    default:
      return DC_ERR_UNKNOWN_COMMAND;
  }
}

}  // namespace

void RegisterFileHandlers(HandlerTable& table) {
  table.Set(DC_CMD_FILE, [](RequestContext& ctx) {
    CDataControlCmdBlkFile file;
    AnswerInPlace(ctx, file, RunFileCommand);
  });
}

}  // namespace gpsdc
