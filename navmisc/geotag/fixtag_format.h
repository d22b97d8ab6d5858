// The command file through which the library and the tagging tool "FixTag.exe" talk: the names
// both sides use, in one place. The format is described in docs/photo-tagging.md.
#pragma once

namespace navmisc::fixtag {

// The tool, in the program folder, and its switch; the tool's arguments are "-ZE" and the
// command file's path.
inline constexpr const wchar_t* kProgram = L"FixTag.exe";
inline constexpr const wchar_t* kSwitch = L"-ZE";
// The command file of a thread: "<data root>/<thread id, upper-case hex>_profile.ini".
inline constexpr const wchar_t* kFileName = L"profile.ini";

inline constexpr const wchar_t* kPropSection = L"PROP";
inline constexpr const wchar_t* kCount = L"Count";
inline constexpr const wchar_t* kFileSection = L"File.%d";  // 0, 1, ...

inline constexpr const wchar_t* kOldFile = L"Old File";   // the photo acted on
inline constexpr const wchar_t* kNewFile = L"New File";   // copy request: the photo to copy to
inline constexpr const wchar_t* kReadOnly = L"ReadOnly";  // read request when "true"
inline constexpr const wchar_t* kTrue = L"true";

// Written by the library into write requests and by the tool in answer to read requests.
inline constexpr const wchar_t* kLatitude = L"Latitude";    // degrees, north positive
inline constexpr const wchar_t* kLongitude = L"Longitude";  // degrees, east positive
inline constexpr const wchar_t* kAltitude = L"Altitude";    // metres
inline constexpr const wchar_t* kSpeed = L"Speed";          // km/h
inline constexpr const wchar_t* kComment = L"Comment";
// Answers to read requests only.
inline constexpr const wchar_t* kXPComment = L"Image.XPComment";
inline constexpr const wchar_t* kUserComment = L"Photo.UserComment";
inline constexpr const wchar_t* kDateTimeOriginal = L"Photo.DateTimeOriginal";
inline constexpr const wchar_t* kDateTime = L"Image.DateTime";
// Written by the tool into a section whose request failed: why, in one line. The library does
// not read it; it is there for people and tests looking at the file.
inline constexpr const wchar_t* kError = L"Error";

}  // namespace navmisc::fixtag
