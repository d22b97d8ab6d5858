// Windows and messages, as the channel's replies and the dialogs use them: a window is an object
// with a message handler and an owning thread (the thread that made it). Messages to a window
// are always handled on its owning thread, while that thread runs its message loop
// (ReleaseCPUTime, navmisc::PumpMessagesUntil) or waits in SendMessageW itself. A toolkit front
// end, the command-line tool or a test drives that loop.
#pragma once

#include <cstdint>
#include <functional>

struct HWND__;
using HWND = HWND__*;  // a window's handle: a number, never an address to follow
using UINT = unsigned int;
using WPARAM = uintptr_t;
using LPARAM = intptr_t;
using LRESULT = intptr_t;

inline constexpr UINT WM_NULL = 0x0000;
inline constexpr UINT WM_TIMER = 0x0113;
inline constexpr UINT WM_USER = 0x0400;

class CWnd {
 public:
  // The window belongs to the calling thread and gets a handle that is never reused.
  CWnd();
  // Must run on the owning thread. Messages still on their way to the window are dropped; a
  // SendMessageW waiting for one of them returns 0.
  virtual ~CWnd();
  CWnd(const CWnd&) = delete;
  CWnd& operator=(const CWnd&) = delete;

  HWND GetSafeHwnd() const { return hwnd_; }
  // The kernel's id of the owning thread.
  unsigned long OwnerThreadId() const { return ownerThread_; }

  // Handles one message, on the owning thread.
  virtual LRESULT WindowProc(UINT message, WPARAM wParam, LPARAM lParam) = 0;

 private:
  HWND hwnd_;
  unsigned long ownerThread_;
};

// Handles the message on the window's owning thread and returns the handler's result. From
// another thread the caller waits until it has been handled, meanwhile handling the messages
// sent to its own windows (so two threads sending to each other never deadlock). 0 when the
// window does not exist or its thread has ended.
LRESULT SendMessageW(HWND hwnd, UINT message, WPARAM wParam, LPARAM lParam);
// Queues the message for the window's thread and returns at once; false when there is no such
// window.
bool PostMessageW(HWND hwnd, UINT message, WPARAM wParam, LPARAM lParam);
// Every `elapseMs` milliseconds the window's thread handles WM_TIMER with wParam `id` (when it
// has no other message waiting). Setting an id again restarts it. Returns `id`, 0 when there
// is no such window. The last argument (a callback on the original platform) must be null.
uintptr_t SetTimer(HWND hwnd, uintptr_t id, UINT elapseMs, void* unused = nullptr);
bool KillTimer(HWND hwnd, uintptr_t id);
bool IsWindow(HWND hwnd);

// An idle wait of `ms` milliseconds that keeps the calling thread's windows alive: their
// messages and timers are handled as they come; between them the thread sleeps. The window and
// icon arguments of the original platform are accepted and ignored.
void ReleaseCPUTime(unsigned ms, HWND hwnd = nullptr, void* icon = nullptr);

namespace navmisc {

// Handles the calling thread's messages until `done` returns true (asked after each message)
// or `timeoutMs` has passed. True when `done` held. A condition that other threads change
// without a message needs them to post one (WM_NULL will do) to a window of this thread.
bool PumpMessagesUntil(const std::function<bool()>& done, unsigned timeoutMs);

}  // namespace navmisc
