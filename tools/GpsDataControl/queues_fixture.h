// The fixture of the data-control process's tests: a fresh data root and its two queues, made as
// the command thread makes them, with helpers to send requests and take replies.
#pragma once

#include <gtest/gtest.h>

#include <memory>

#include "navmisc/datactrl/block_codec.h"
#include "navmisc/datactrl/request_queue.h"
#include "navmisc/platform/data_root.h"
#include "navmisc/platform/msg_queue.h"
#include "testutil.h"

// The two queues of a fresh data root, as the command thread makes them.
class Queues : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(navmisc::UseDataRoot(root_.path()));
    requests_ = std::make_unique<CxSysMsgQueue>(navmisc::datactrl::kRequestQueueName, 64,
                                                navmisc::kSysMsgOpenOrCreate);
    replies_ = std::make_unique<CxSysMsgQueue>(navmisc::datactrl::kReplyQueueName, 64,
                                               navmisc::kSysMsgOpenOrCreate);
    ASSERT_TRUE(requests_->IsValid() && replies_->IsValid());
  }
  void TearDown() override { navmisc::RemovePerRootObjects(root_.path()); }

  template <class Block>
  void Request(const Block& block) {
    CPackageBlk p;
    navmisc::datactrl::PackBlock(block, p);
    ASSERT_TRUE(requests_->Send(p.GetPackagePtr(), p.GetPackageSize()));
  }
  // The next reply, unpacked as `Block`.
  template <class Block>
  Block Reply(Block block = {}) {
    CxSysMsgInfo info;
    auto bytes = replies_->Receive(10000, &info);
    EXPECT_TRUE(bytes);
    if (!bytes) return block;
    CUnpackageBlk u(bytes.get(), info.nSize);
    navmisc::datactrl::UnpackBlock(u, block);
    return block;
  }

  navmisc::testutil::TempDir root_;
  std::unique_ptr<CxSysMsgQueue> requests_, replies_;
};
