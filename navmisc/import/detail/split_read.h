// Reading a long GPX or TCX file on two cores. The XML parser is most of an import's time and
// cannot share a document between threads, so the document is cut in two between two track
// points: the first part is read here, and the second on a thread of its own by a second reader
// that first reads the document's head, up to its first track point, to stand where the first
// reader will stand at the cut. The second reader's findings wait in a bounded queue.
//
// The cut is taken only when it is sound: when the first reader arrives at it in element content
// between two points, in the very state and XML context (open elements, namespaces) that the
// second reader had after the head, the bytes after the cut read the same for both. Otherwise,
// and whenever the second part fails, the first reader goes on through the rest of the document
// on its own (skipping what the queue has already delivered). So a document that reads well gives
// the sink the same calls as a reading in one piece, and one that fails fails at the same place,
// found by the same reader that reads in one piece.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>

#include "navmisc/import/detail/xml_track_reader.h"

namespace navmisc::import::detail {

struct SplitInput {
  uint64_t size = 0;  // of the document when it was opened
  // Reads up to `size` bytes at `offset`: the count, 0 at the end, -1 on failure with the reason
  // in `error`. Called from both threads at once.
  std::function<long(uint64_t offset, char* buffer, size_t size, std::string& error)> readAt;
  // The document's first bytes, as far as they were read already.
  std::string_view head;
};

struct SplitOutcome {
  ReadStatus status;
  ReadCounts counts;
  bool cut = false;  // the second part's findings were used
};

using ReaderFactory = std::function<std::unique_ptr<XmlTrackReader>(ImportSink&)>;

// Reads the document into `sink` in two parts, cut near `cutNear`. False when the document
// offers no place to cut there (no track point in its head, none near the cut): nothing has
// reached the sink, and the caller reads the document in one piece. `fed` is told how many
// bytes have been read so far, from the calling thread.
bool ReadInTwoParts(const SplitInput& input, uint64_t cutNear, const ReaderFactory& makeReader,
                    ImportSink& sink, const std::function<void(uint64_t)>& fed, SplitOutcome& out);

}  // namespace navmisc::import::detail
