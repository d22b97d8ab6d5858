// The results a dialog ends with and the answers of a message box, shared by every dialog
// controller of the library.
#pragma once

inline constexpr int IDOK = 1;
inline constexpr int IDCANCEL = 2;
inline constexpr int IDYES = 6;
inline constexpr int IDNO = 7;
