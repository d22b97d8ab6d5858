// The question asked before the library writes a position into a user's original photo file, as a
// controller over an abstract view: the logic lives here and is tested without a display; a
// program supplies the view (the command-line tool asks in its terminal).
#pragma once

#include "navmisc/platform/cstring.h"

// The answers of the question.
constexpr int IDCANCEL = 2;  // no, for this photo and every following one
constexpr int IDYES = 6;
constexpr int IDNO = 7;
constexpr int IDYESTOALL = 637;  // yes, for this photo and every following one

// What a program shows the user.
class COverwriteView {
 public:
  virtual ~COverwriteView() = default;
  // Asks whether the original file of the photo `photoName` may be changed. `noAsk` is the box
  // that stops further questions: shown preset, left as the user set it. Returns IDYES, IDNO,
  // IDCANCEL or IDYESTOALL.
  virtual int AskOverwrite(const wchar_t* photoName, bool& noAsk) = 0;
  // A yes/no question with the given text; true for yes.
  virtual bool Confirm(const wchar_t* message) = 0;
};

// The view the library asks through, for the whole process; null (the default) when no one can
// be asked. The view must outlive its use; set it back to null before destroying it.
void SetOverwriteView(COverwriteView* view);
COverwriteView* GetOverwriteView();

class COverwriteDlg {
 public:
  // `view` null: the process's view (SetOverwriteView).
  explicit COverwriteDlg(const wchar_t* photoName, COverwriteView* view = nullptr);

  // Asks and returns the answer. Without a view, or when the view answers anything but the four
  // answers, the answer is IDNO: an original is changed only when someone agreed.
  int DoModal();
  // A yes/no question through the same view; false without one.
  static bool Confirm(const wchar_t* message, COverwriteView* view = nullptr);

  CString m_strPhotoName;
  bool m_bNoAsk = false;  // the box that stops further questions

 private:
  COverwriteView* view_;
};
