// The shared blocks of this process, so that choosing a data root can move all of them.
#pragma once

namespace navmisc {
class PerRootBlock;
namespace detail {
void RegisterPerRootBlock(PerRootBlock* block);
}  // namespace detail
}  // namespace navmisc
