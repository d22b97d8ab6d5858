// The data-control process's loop: reads requests from "Data_Control_Send", hands each to the
// handler of its kind and ends on the exit block (or when the program that started it is gone).
#pragma once

#include <sys/types.h>

#include <deque>
#include <vector>

#include "handlers.h"

namespace gpsdc {

class DataControlServer {
 public:
  DataControlServer(CxSysMsgQueue& requests, CxSysMsgQueue& replies, Config config,
                    Product product);

  // Announces the state of the logger and of the web service, then serves requests until an
  // exit block comes or the parent process has ended. Returns the process's exit code (0).
  int Run();

  // Requests that were not well-formed packages, or of a kind without a handler.
  int dropped() const { return dropped_; }

 private:
  // Handles one package; false when it was the exit block.
  bool Serve(const uint8_t* data, uint32_t size);
  // Looks at the requests that came while a handler works (RequestContext::stopRequested).
  bool StopRequested();

  CxSysMsgQueue& requests_;
  ReplyChannel replies_;
  Config config_;
  Product product_;
  HandlerTable handlers_;
  pid_t parent_;
  int dropped_ = 0;
  std::deque<std::vector<uint8_t>> waiting_;  // requests that came while a handler worked
  bool stop_ = false;                         // a cancel or the exit block came meanwhile
  bool exit_ = false;                         // the exit block came meanwhile
};

}  // namespace gpsdc
