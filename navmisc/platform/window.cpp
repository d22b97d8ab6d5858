#include "navmisc/platform/window.h"

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <deque>
#include <memory>
#include <mutex>
#include <unordered_map>
#include <vector>

#include "navmisc/platform/process.h"

namespace navmisc {
namespace {

using Clock = std::chrono::steady_clock;

struct ThreadQueue;

// A message sent from another thread: its sender waits on its own queue until `done`, which is
// guarded by that queue's mutex.
struct SentState {
  std::shared_ptr<ThreadQueue> sender;
  LRESULT result = 0;
  bool done = false;
};

struct Message {
  HWND hwnd;
  UINT message;
  WPARAM wParam;
  LPARAM lParam;
  std::shared_ptr<SentState> sent;  // null for a posted message
};

struct Timer {
  HWND hwnd;
  uintptr_t id;
  Clock::duration interval;
  Clock::time_point due;
};

// The messages waiting for one thread. Sent messages go before posted ones, timers last.
struct ThreadQueue {
  std::mutex mutex;
  std::condition_variable wake;
  std::deque<Message> sent;
  std::deque<Message> posted;
  std::vector<Timer> timers;
  bool alive = true;
};

void Complete(SentState& state, LRESULT result) {
  std::lock_guard lock(state.sender->mutex);
  state.result = result;
  state.done = true;
  state.sender->wake.notify_all();
}

// The calling thread's queue, made on first use. When the thread ends, messages still sent to
// it are answered with 0 so that no sender waits for ever.
class QueueOwner {
 public:
  QueueOwner() : queue_(std::make_shared<ThreadQueue>()) {}
  ~QueueOwner() {
    std::deque<Message> orphans;
    {
      std::lock_guard lock(queue_->mutex);
      queue_->alive = false;
      orphans.swap(queue_->sent);
      queue_->posted.clear();
      queue_->timers.clear();
    }
    for (Message& m : orphans) Complete(*m.sent, 0);
  }
  const std::shared_ptr<ThreadQueue>& queue() const { return queue_; }

 private:
  std::shared_ptr<ThreadQueue> queue_;
};

const std::shared_ptr<ThreadQueue>& MyQueue() {
  thread_local QueueOwner owner;
  return owner.queue();
}

struct WindowEntry {
  CWnd* window;
  std::shared_ptr<ThreadQueue> queue;
};

struct Registry {
  std::mutex mutex;
  std::unordered_map<uintptr_t, WindowEntry> windows;
  std::atomic<uintptr_t> nextHandle{1};
};

Registry& Windows() {
  static Registry* const registry = new Registry;  // outlives windows in static objects
  return *registry;
}

bool Find(HWND hwnd, WindowEntry& entry) {
  Registry& r = Windows();
  std::lock_guard lock(r.mutex);
  const auto it = r.windows.find(reinterpret_cast<uintptr_t>(hwnd));
  if (it == r.windows.end()) return false;
  entry = it->second;
  return true;
}

// Runs one message on the owning thread. The window may have gone meanwhile: it is looked up
// again (only its own thread destroys it, so it cannot go while its handler runs).
void Dispatch(const Message& m) {
  WindowEntry entry;
  const LRESULT result = Find(m.hwnd, entry) ? entry.window->WindowProc(m.message, m.wParam, m.lParam) : 0;
  if (m.sent) Complete(*m.sent, result);
}

// Handles one waiting message of the calling thread, or sleeps until one comes, `until` passes
// or `stop` (checked under the queue's lock) holds. `sentOnly` leaves posted messages and
// timers for later, as a thread waiting in SendMessageW does.
void HandleOne(Clock::time_point until, const std::function<bool()>& stop, bool sentOnly) {
  ThreadQueue& q = *MyQueue();
  std::unique_lock lock(q.mutex);
  for (;;) {
    if (stop && stop()) return;
    if (!q.sent.empty() || (!sentOnly && !q.posted.empty())) {
      std::deque<Message>& from = q.sent.empty() ? q.posted : q.sent;
      Message m = std::move(from.front());
      from.pop_front();
      lock.unlock();
      Dispatch(m);
      return;
    }
    const Clock::time_point now = Clock::now();
    Clock::time_point wakeAt = until;
    if (!sentOnly) {
      for (Timer& t : q.timers) {
        if (t.due <= now) {
          t.due = now + t.interval;
          const Message m{t.hwnd, WM_TIMER, t.id, 0, nullptr};
          lock.unlock();
          Dispatch(m);
          return;
        }
        wakeAt = std::min(wakeAt, t.due);
      }
    }
    if (now >= until) return;
    q.wake.wait_until(lock, wakeAt);
  }
}

}  // namespace

bool PumpMessagesUntil(const std::function<bool()>& done, unsigned timeoutMs) {
  const Clock::time_point until = Clock::now() + std::chrono::milliseconds(timeoutMs);
  for (;;) {
    if (done && done()) return true;
    if (Clock::now() >= until) return done && done();
    HandleOne(until, nullptr, false);
  }
}

}  // namespace navmisc

using navmisc::Clock;

CWnd::CWnd() : ownerThread_(navmisc::GetCurrentThreadId()) {
  navmisc::Registry& r = navmisc::Windows();
  const uintptr_t handle = r.nextHandle.fetch_add(1);
  hwnd_ = reinterpret_cast<HWND>(handle);
  std::lock_guard lock(r.mutex);
  r.windows[handle] = {this, navmisc::MyQueue()};
}

CWnd::~CWnd() {
  navmisc::Registry& r = navmisc::Windows();
  std::shared_ptr<navmisc::ThreadQueue> queue;
  {
    std::lock_guard lock(r.mutex);
    const auto it = r.windows.find(reinterpret_cast<uintptr_t>(hwnd_));
    if (it == r.windows.end()) return;
    queue = it->second.queue;
    r.windows.erase(it);
  }
  std::lock_guard lock(queue->mutex);
  std::erase_if(queue->timers, [this](const navmisc::Timer& t) { return t.hwnd == hwnd_; });
}

LRESULT SendMessageW(HWND hwnd, UINT message, WPARAM wParam, LPARAM lParam) {
  navmisc::WindowEntry entry;
  if (!navmisc::Find(hwnd, entry)) return 0;
  const std::shared_ptr<navmisc::ThreadQueue>& mine = navmisc::MyQueue();
  if (entry.queue == mine) return entry.window->WindowProc(message, wParam, lParam);
  auto state = std::make_shared<navmisc::SentState>();
  state->sender = mine;
  {
    std::lock_guard lock(entry.queue->mutex);
    if (!entry.queue->alive) return 0;
    entry.queue->sent.push_back({hwnd, message, wParam, lParam, state});
    entry.queue->wake.notify_all();
  }
  // While waiting, messages sent to this thread are handled, so that a handler on the other
  // side may send back to this thread's windows.
  const auto done = [&state] { return state->done; };
  for (;;) {
    {
      std::lock_guard lock(mine->mutex);
      if (state->done) return state->result;
    }
    navmisc::HandleOne(Clock::now() + std::chrono::hours(1), done, true);
  }
}

bool PostMessageW(HWND hwnd, UINT message, WPARAM wParam, LPARAM lParam) {
  navmisc::WindowEntry entry;
  if (!navmisc::Find(hwnd, entry)) return false;
  std::lock_guard lock(entry.queue->mutex);
  if (!entry.queue->alive) return false;
  entry.queue->posted.push_back({hwnd, message, wParam, lParam, nullptr});
  entry.queue->wake.notify_all();
  return true;
}

uintptr_t SetTimer(HWND hwnd, uintptr_t id, UINT elapseMs, void* /*unused*/) {
  navmisc::WindowEntry entry;
  if (!navmisc::Find(hwnd, entry)) return 0;
  const auto interval = std::chrono::milliseconds(std::max<UINT>(elapseMs, 1));
  std::lock_guard lock(entry.queue->mutex);
  std::erase_if(entry.queue->timers,
                [&](const navmisc::Timer& t) { return t.hwnd == hwnd && t.id == id; });
  entry.queue->timers.push_back({hwnd, id, interval, Clock::now() + interval});
  entry.queue->wake.notify_all();
  return id;
}

bool KillTimer(HWND hwnd, uintptr_t id) {
  navmisc::WindowEntry entry;
  if (!navmisc::Find(hwnd, entry)) return false;
  std::lock_guard lock(entry.queue->mutex);
  return std::erase_if(entry.queue->timers, [&](const navmisc::Timer& t) {
           return t.hwnd == hwnd && t.id == id;
         }) > 0;
}

bool IsWindow(HWND hwnd) {
  navmisc::WindowEntry entry;
  return navmisc::Find(hwnd, entry);
}

void ReleaseCPUTime(unsigned ms, HWND /*hwnd*/, void* /*icon*/) {
  navmisc::PumpMessagesUntil(nullptr, ms);
}
