// Settings keys of a photo's section, shared by its writer and reader.
#pragma once

namespace navmisc::photo_keys {

inline constexpr const wchar_t* kItemName = L"photo_item_name";
inline constexpr const wchar_t* kOriginalName = L"photo_original_name";
inline constexpr const wchar_t* kItemId = L"photo_item_id";
inline constexpr const wchar_t* kWidth = L"width";
inline constexpr const wchar_t* kHeight = L"height";
inline constexpr const wchar_t* kOriginalWidth = L"original_width";
inline constexpr const wchar_t* kOriginalHeight = L"original_height";
inline constexpr const wchar_t* kDataType = L"data_type";
inline constexpr const wchar_t* kTitle = L"title";
inline constexpr const wchar_t* kDescription = L"description";
inline constexpr const wchar_t* kEmbedded = L"embedded";
inline constexpr const wchar_t* kMarkerIconId = L"marker_icon_id";
inline constexpr const wchar_t* kLatitude = L"latitude";
inline constexpr const wchar_t* kLongitude = L"longitude";
inline constexpr const wchar_t* kAltitude = L"altitude";
inline constexpr const wchar_t* kSpeed = L"speed";
inline constexpr const wchar_t* kTrackItemId = L"track_item_id";
inline constexpr const wchar_t* kPlaybackTime = L"playback_time";
inline constexpr const wchar_t* kOriginalTime = L"original_time";
inline constexpr const wchar_t* kNetDirty = L"net_dirty";
inline constexpr const wchar_t* kPublic = L"public";
inline constexpr const wchar_t* kServerId = L"server_id";
inline constexpr const wchar_t* kNetUrl = L"net_url_%d";
inline constexpr const wchar_t* kDimensionW = L"dimension_W%d";
// The first height key is written in lower case and read in upper case; keys match without
// regard to case, so both name the same value. Kept so that files stay as they always were.
inline constexpr const wchar_t* kDimensionH0Written = L"dimension_h0";
inline constexpr const wchar_t* kDimensionH = L"dimension_H%d";
inline constexpr const wchar_t* k2ndDirty = L"2nd_dirty";
inline constexpr const wchar_t* k2ndPublic = L"2nd_public";
inline constexpr const wchar_t* k2ndServer = L"2nd_server";
inline constexpr const wchar_t* k2ndServerId = L"2nd_server_id";
inline constexpr const wchar_t* k2ndNetUrl = L"2nd_net_url_%d";
inline constexpr const wchar_t* k2ndDimensionW = L"2nd_dimension_W%d";
inline constexpr const wchar_t* k2ndDimensionH = L"2nd_dimension_H%d";

}  // namespace navmisc::photo_keys
