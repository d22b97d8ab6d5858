#include "navmisc/import/detail/split_read.h"

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <deque>
#include <mutex>
#include <string>
#include <system_error>
#include <thread>
#include <utility>
#include <vector>

#include "navmisc/import/import_errors.h"

namespace navmisc::import::detail {
namespace {

// How far past the intended cut a point's opening is looked for.
constexpr size_t kWindow = 64u << 10;
constexpr size_t kBatchEvents = 4096;
constexpr size_t kBatchBytes = 1u << 20;
// What the second part may have waiting before it waits itself: about 800,000 points.
constexpr size_t kMaxQueued = 64u << 20;

// The offset of the first "<name" that opens an element of that name, npos when none does.
size_t FindOpening(std::string_view text, std::string_view name) {
  for (size_t at = text.find('<'); at != std::string_view::npos; at = text.find('<', at + 1)) {
    const size_t after = at + 1 + name.size();
    if (after >= text.size()) return std::string_view::npos;
    if (text.compare(at + 1, name.size(), name) != 0) continue;
    const char c = text[after];
    if (c == ' ' || c == '\t' || c == '\r' || c == '\n' || c == '>' || c == '/') return at;
  }
  return std::string_view::npos;
}

// One finding of the second part; texts wait beside the events of their batch.
struct Event {
  enum class Kind : uint8_t { kDocument, kTrack, kSegment, kPoint, kEndTrack, kMarker };
  Kind kind;
  uint32_t index;  // into the batch's tracks, markers or documents
  ImportPoint point;
};

struct Batch {
  std::vector<Event> events;
  std::vector<ImportTrack> tracks;
  std::vector<ImportMarker> markers;
  std::vector<std::pair<std::string, std::string>> documents;
  size_t bytes = 0;
};

// Between the two threads: the second reader's state after the head, its batches, its end.
class Handover {
 public:
  void PublishState(std::string state) {
    std::lock_guard lock(mutex_);
    if (stateReady_) return;
    state_ = std::move(state);
    stateReady_ = true;
    changed_.notify_all();
  }
  std::string WaitState() {
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [&] { return stateReady_; });
    return state_;
  }
  // Waits while the queue is full; false once the first part wants nothing more.
  bool Push(Batch&& batch) {
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [&] { return abandoned_ || queued_ < kMaxQueued; });
    if (abandoned_) return false;
    queued_ += batch.bytes;
    batches_.push_back(std::move(batch));
    changed_.notify_all();
    return true;
  }
  void Finish(ReadStatus status, ReadCounts counts) {
    std::lock_guard lock(mutex_);
    status_ = std::move(status);
    counts_ = counts;
    finished_ = stateReady_ = true;
    changed_.notify_all();
  }
  // The next batch; false when the second part has ended and everything was taken.
  bool Pop(Batch& batch) {
    std::unique_lock lock(mutex_);
    changed_.wait(lock, [&] { return !batches_.empty() || finished_; });
    if (batches_.empty()) return false;
    batch = std::move(batches_.front());
    batches_.pop_front();
    queued_ -= batch.bytes;
    changed_.notify_all();
    return true;
  }
  void Abandon() {
    std::lock_guard lock(mutex_);
    abandoned_ = true;
    batches_.clear();
    queued_ = 0;
    changed_.notify_all();
  }
  // After Pop said the end: how the second part ended, and what it found after the head.
  std::pair<ReadStatus, ReadCounts> Result() {
    std::lock_guard lock(mutex_);
    return {status_, counts_};
  }
  std::atomic<uint64_t> bytesRead{0};
  // Read without the lock too: the second part stops reading early.
  bool abandoned() const { return abandoned_; }

 private:
  std::mutex mutex_;
  std::condition_variable changed_;
  std::string state_;
  bool stateReady_ = false;
  std::deque<Batch> batches_;
  size_t queued_ = 0;
  std::atomic<bool> abandoned_{false};
  bool finished_ = false;
  ReadStatus status_;
  ReadCounts counts_;
};

// The second reader's sink: what it finds after the head goes into batches.
class QueueSink final : public ImportSink {
 public:
  explicit QueueSink(Handover& handover) : handover_(handover) { Reset(); }
  void Arm() { armed_ = true; }
  bool Flush() {
    if (batch_.events.empty()) return open_;
    if (open_) open_ = handover_.Push(std::move(batch_));
    Reset();
    return open_;
  }

  bool Document(const std::string& name, const std::string& description) override {
    if (!armed_) return true;
    batch_.documents.emplace_back(name, description);
    batch_.bytes += name.size() + description.size();
    return Add(Event::Kind::kDocument, batch_.documents.size() - 1);
  }
  bool BeginTrack(const ImportTrack& track) override {
    if (!armed_) return true;
    batch_.tracks.push_back(track);
    batch_.bytes += sizeof track + track.name.size() + track.description.size();
    return Add(Event::Kind::kTrack, batch_.tracks.size() - 1);
  }
  bool BeginSegment() override { return !armed_ || Add(Event::Kind::kSegment, 0); }
  bool Point(const ImportPoint& point) override { return !armed_ || Add(Event::Kind::kPoint, 0, &point); }
  bool EndTrack() override { return !armed_ || Add(Event::Kind::kEndTrack, 0); }
  bool Marker(const ImportMarker& marker) override {
    if (!armed_) return true;
    batch_.markers.push_back(marker);
    batch_.bytes += sizeof marker + marker.name.size() + marker.description.size() + marker.symbol.size();
    return Add(Event::Kind::kMarker, batch_.markers.size() - 1);
  }

 private:
  bool Add(Event::Kind kind, size_t index, const ImportPoint* point = nullptr) {
    batch_.events.push_back({kind, static_cast<uint32_t>(index), point ? *point : ImportPoint{}});
    batch_.bytes += sizeof(Event);
    if (batch_.events.size() >= kBatchEvents || batch_.bytes >= kBatchBytes) return Flush();
    return open_;
  }
  void Reset() {
    batch_ = Batch{};
    batch_.events.reserve(kBatchEvents);
  }

  Handover& handover_;
  Batch batch_;
  bool armed_ = false;
  bool open_ = true;
};

// The first reader's sink: passes everything on, except the first `Skip` findings after a
// second part that failed, which the queue has delivered already.
class GateSink final : public ImportSink {
 public:
  explicit GateSink(ImportSink& next) : next_(next) {}
  void Skip(uint64_t count) { skip_ = count; }
  bool Document(const std::string& n, const std::string& d) override { return Pass() || next_.Document(n, d); }
  bool BeginTrack(const ImportTrack& t) override { return Pass() || next_.BeginTrack(t); }
  bool BeginSegment() override { return Pass() || next_.BeginSegment(); }
  bool Point(const ImportPoint& p) override { return Pass() || next_.Point(p); }
  bool EndTrack() override { return Pass() || next_.EndTrack(); }
  bool Marker(const ImportMarker& m) override { return Pass() || next_.Marker(m); }

 private:
  // True while findings are skipped.
  bool Pass() {
    if (skip_ == 0) return false;
    --skip_;
    return true;
  }
  ImportSink& next_;
  uint64_t skip_ = 0;
};

// Feeds the bytes [from, to) of the input (to the end when `to` is past it) to `reader`, while
// `goOn` says so after each piece. False when they could not be read (`error` says why); a
// reader that stops is not a failure here.
bool FeedRange(XmlTrackReader& reader, const SplitInput& input, uint64_t from, uint64_t to,
               std::vector<char>& buffer, std::string& error, const std::function<bool(uint64_t)>& goOn) {
  for (uint64_t at = from; at < to;) {
    const size_t want = static_cast<size_t>(std::min<uint64_t>(buffer.size(), to - at));
    const long n = input.readAt(at, buffer.data(), want, error);
    if (n < 0) return false;
    if (n == 0) break;
    at += static_cast<uint64_t>(n);
    if (!reader.Feed(buffer.data(), static_cast<size_t>(n)) || !goOn(at)) break;
  }
  return true;
}

void ReadSecondPart(const SplitInput& input, std::string_view head, uint64_t cut,
                    const ReaderFactory& makeReader, Handover& handover) {
  QueueSink sink(handover);
  ReadStatus status{DC_ERR_IMPORT_CANCELLED, "no place to cut"};
  ReadCounts found;
  try {
    std::unique_ptr<XmlTrackReader> reader = makeReader(sink);
    reader->Feed(head.data(), head.size());
    std::string state = reader->SplitState();
    const bool usable = !state.empty();
    handover.PublishState(std::move(state));
    if (usable) {
      const ReadCounts before = reader->counts();
      sink.Arm();
      std::vector<char> buffer(kReadPiece);
      std::string error;
      const bool read = FeedRange(*reader, input, cut, UINT64_MAX, buffer, error,
                                  [&](uint64_t at) {
                                    handover.bytesRead = at - cut;
                                    return !handover.abandoned();
                                  });
      if (read && reader->status().ok()) reader->Finish();
      sink.Flush();
      status = read ? reader->status() : ReadStatus{DC_ERR_IMPORT_READ, error};
      found = reader->counts();
      found.tracks -= before.tracks;
      found.points -= before.points;
      found.markers -= before.markers;
    }
  } catch (const std::exception& e) {
    status = {DC_ERR_IMPORT_READ, e.what()};
  }
  handover.Finish(std::move(status), found);
}

// Hands a finding of the second part to the sink, counting it as its reader would have.
bool Deliver(const Batch& batch, const Event& event, ImportSink& sink, ReadCounts& counts) {
  switch (event.kind) {
    case Event::Kind::kDocument: {
      const auto& [name, description] = batch.documents[event.index];
      return sink.Document(name, description);
    }
    case Event::Kind::kTrack:
      ++counts.tracks;
      return sink.BeginTrack(batch.tracks[event.index]);
    case Event::Kind::kSegment: return sink.BeginSegment();
    case Event::Kind::kPoint:
      ++counts.points;
      return sink.Point(event.point);
    case Event::Kind::kEndTrack: return sink.EndTrack();
    case Event::Kind::kMarker:
      ++counts.markers;
      return sink.Marker(batch.markers[event.index]);
  }
  return false;
}

}  // namespace

bool ReadInTwoParts(const SplitInput& input, uint64_t cutNear, const ReaderFactory& makeReader,
                    ImportSink& sink, const std::function<void(uint64_t)>& fed, SplitOutcome& out) {
  GateSink gate(sink);
  std::unique_ptr<XmlTrackReader> first = makeReader(gate);
  const std::string_view point = first->PointElement();
  const size_t headEnd = FindOpening(input.head, point);
  if (headEnd == std::string_view::npos || headEnd == 0 || cutNear <= headEnd || cutNear >= input.size)
    return false;
  std::string window(kWindow, '\0'), error;
  const long got = input.readAt(cutNear, window.data(), window.size(), error);
  if (got <= 0) return false;
  const size_t offset = FindOpening(std::string_view(window.data(), static_cast<size_t>(got)), point);
  if (offset == std::string_view::npos) return false;
  const uint64_t cut = cutNear + offset;

  auto progress = [&fed](uint64_t at) {
    if (fed) fed(at);
    return true;
  };
  Handover handover;
  std::thread second;
  try {
    second = std::thread(ReadSecondPart, std::cref(input), input.head.substr(0, headEnd), cut,
                         std::cref(makeReader), std::ref(handover));
  } catch (const std::system_error&) {
    return false;  // no thread to be had: one piece it is
  }
  struct Join {
    Handover& handover;
    std::thread& thread;
    ~Join() {
      handover.Abandon();
      thread.join();
    }
  } join{handover, second};

  auto settle = [&](ReadStatus status) {
    out.status = std::move(status);
    out.counts = first->counts();
    return true;
  };
  // The rest of the document by the first reader alone.
  std::vector<char> buffer(kReadPiece);
  auto readOn = [&] {
    if (!FeedRange(*first, input, cut, UINT64_MAX, buffer, error, progress))
      return settle({DC_ERR_IMPORT_READ, "cannot read the file: " + error});
    if (first->status().ok()) first->Finish();
    return settle(first->status());
  };

  if (!FeedRange(*first, input, 0, cut, buffer, error, progress))
    return settle({DC_ERR_IMPORT_READ, "cannot read the file: " + error});
  if (!first->status().ok()) return settle(first->status());
  const std::string state = first->SplitState();
  if (state.empty() || state != handover.WaitState()) {
    handover.Abandon();
    return readOn();
  }

  out.cut = true;
  ReadCounts counts = first->counts();
  uint64_t delivered = 0;
  Batch batch;
  while (handover.Pop(batch)) {
    for (const Event& event : batch.events) {
      ++delivered;
      if (!Deliver(batch, event, sink, counts)) {
        out.status = {DC_ERR_IMPORT_CANCELLED, "stopped"};
        out.counts = counts;
        return true;
      }
    }
    if (fed) fed(cut + handover.bytesRead);
  }
  auto [status, found] = handover.Result();
  if (status.ok()) {
    out.counts = first->counts();
    out.counts.tracks += found.tracks;
    out.counts.points += found.points;
    out.counts.markers += found.markers;
    out.status = std::move(status);
    return true;
  }
  // The second part failed: the first reader goes on from the cut to find the same failure and
  // say it as reading in one piece would, passing over what the queue delivered.
  gate.Skip(delivered);
  return readOn();
}

}  // namespace navmisc::import::detail
