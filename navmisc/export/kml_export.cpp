#include "navmisc/export/kml_export.h"

#include <string>
#include <vector>

#include "navmisc/export/detail/export_common.h"
#include "navmisc/platform/datetime.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/format.h"
#include "navmisc/platform/temp_folder.h"
#include "navmisc/platform/textconv.h"
#include "navmisc/platform/user_locale.h"
#include "navmisc/platform/zip_archive.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/track.h"
#include "navmisc/records/trip.h"

namespace {

using namespace navmisc::exportdetail;
using navmisc::AppendFixed;
using navmisc::AppendInt;

// Escapes item texts: "&", "<", ">", the double quote, and a pair of apostrophes (one entity).
std::wstring KmlEscape(std::wstring_view text) {
  CString s{std::wstring(text)};
  // "&" goes first so that the entities made by the later rules are not escaped again. A single
  // apostrophe stays as it is; only a pair becomes one entity.
  s.Replace(L"&", L"&amp;");
  s.Replace(L"<", L"&lt;");
  s.Replace(L">", L"&gt;");
  s.Replace(L"\"", L"&quot;");
  s.Replace(L"''", L"&apos;");
  return s.str();
}

// The date-time text of a photo's placemark (UTC, no "Z"): its time on the track, else (when
// that is -1) the camera's time less the trip's time shift, else (both -1) empty.
std::string KmlPhotoTimeText(const PHOTO_ITEM_INFO& photo) {
  if (photo.playbackTime != -1) return StdTimeText(photo.playbackTime);
  if (photo.originalTime != -1) {
    // The camera's clock runs on the trip's local time.
    const int64_t shift = photo.trip ? photo.trip->timeZoneShift : 0;
    return StdTimeText(static_cast<int32_t>(photo.originalTime - shift));
  }
  return {};
}

// The size (pixels) at which a photo of `width` x `height` pixels is shown in its balloon: the
// long side 320, the other in proportion; 320 x 240 when the size is unknown.
struct KmlPictureSize {
  int width;
  int height;
};
KmlPictureSize KmlDisplaySize(int width, int height) {
  constexpr int kBox = 320;
  if (width <= 0 || height <= 0) return {kBox, kBox * 3 / 4};
  if (width >= height) {
    return {kBox, static_cast<int>((static_cast<long long>(height) * kBox + width / 2) / width)};
  }
  return {static_cast<int>((static_cast<long long>(width) * kBox + height / 2) / height), kBox};
}

constexpr std::string_view kStyleUrl =
    "#default_copy0+nicon=http://maps.google.com/mapfiles/kml/pal4/icon15.png"
    "+hicon=http://maps.google.com/mapfiles/kml/pal4/icon7.png";
constexpr std::string_view kMarkerIcon = "http://maps.google.com/mapfiles/kml/pal3/icon36.png";
constexpr std::string_view kPhotoIcon = "http://maps.google.com/mapfiles/kml/pal4/icon38.png";

// Texts go through fixed buffers of these sizes in bytes, terminator included.
constexpr size_t kDateBuffer = 512;
constexpr size_t kTrackNameBuffer = 1024;
constexpr size_t kItemTextBuffer = 20480;
constexpr size_t kPathBuffer = 2048;

// A file to put into the archive, and the photo it is a copy of (null for the document).
struct PackEntry {
  CString path;
  const PHOTO_ITEM_INFO* photo = nullptr;
  std::string refused;  // why the photo was not copied for packing (a link out of the data root)
};

// Writes one document; lives for one export call.
class KmlWriter {
 public:
  KmlWriter(CPtrList& tracks, CPtrList& items, int photoSourceMode, ExportControl& control)
      : tracks_(tracks),
        items_(items),
        photoSourceMode_(photoSourceMode),
        control_(control),
        progress_{control.counter, control.keepGoing} {}

  // Photos are then copied into `scratchFolder` and referred to by their bare copy names.
  void SetKmz(const CString& scratchFolder) {
    kmz_ = true;
    scratch_ = scratchFolder;
    pack_.clear();
  }
  std::vector<PackEntry>& pack() { return pack_; }
  bool stopped() const { return stopped_; }

  // False when the target cannot be opened or the caller stopped the export (nothing is left at
  // the target then). The control's error tells why, and any write error.
  bool Write(const CString& path) {
    control_.error.clear();
    if (path.IsEmpty()) {
      control_.error = "no target path";
      return false;
    }
    DocumentWriter w;
    if (!w.Open(path)) {
      control_.error = w.error();
      return false;
    }
    std::string& out = w.text();
    out += "<?xml version=\"1.0\" encoding=\"UTF-8\"?><kml xmlns=\"http://earth.google.com/kml/2.1\">"
           "<Folder><name>";
    out += Utf8Field(UserDateTimeText(GetCurDateTime()).view(), kDateBuffer);
    out += "</name><open>1</open>";
    for (const TRACK_ITEM_INFO* track : navmisc::Items<TRACK_ITEM_INFO>(tracks_)) {
      if (track && !WriteTrack(w, *track)) return Stop(w);
    }
    for (const PHOTO_ITEM_INFO* item : navmisc::Items<PHOTO_ITEM_INFO>(items_)) {
      if (item) WriteItem(out, *item);
      w.MaybeFlush();
      if (!progress_.Step()) return Stop(w);
    }
    out += "</Folder></kml>";
    w.Close();
    control_.error = w.error();
    return true;
  }

 private:
  bool Stop(DocumentWriter& w) {
    Stopped(w, control_);
    stopped_ = true;
    return false;
  }

  bool WriteTrack(DocumentWriter& w, const TRACK_ITEM_INFO& track) {
    std::string& out = w.text();
    // Track names go out raw, and the description repeats the name.
    const std::string name = Utf8Field(track.GetName().view(), kTrackNameBuffer);
    out += "<Placemark><name>";
    out += name;
    out += "</name><description>";
    out += name;
    out += "</description><styleUrl>";
    out += kStyleUrl;
    out += "</styleUrl><Style><LineStyle id=\"khLineStyle989\"><color>7f8000ff</color><width>4</width>"
           "</LineStyle></Style><LineString><tessellate>1</tessellate><coordinates>\r\n";
    const bool finished = ForEachPoint(track, control_.pointsFromFiles, [&](const WAYPOINT_ITEM_INFO* p) {
      if (p && p->time != -1) {
        AppendFixed(out, p->longitude, 6);
        out += ',';
        AppendFixed(out, p->latitude, 6);
        out += ",0 ";
        w.MaybeFlush();
      }
      return progress_.Step();
    });
    if (!finished) return false;
    out += "</coordinates></LineString></Placemark>";
    return true;
  }

  void WriteItem(std::string& out, const PHOTO_ITEM_INFO& item) {
    if (item.dataType == PHOTO_ITEM_INFO::kTypeMarker ||
        item.dataType == PHOTO_ITEM_INFO::kTypeLandmark) {
      const std::string title = Utf8Field(KmlEscape(item.title.view()), kItemTextBuffer);
      out += "\r\n<Placemark><name>";
      out += title;
      out += "</name><description><![CDATA[";
      out += title;
      out += "<br>";
      out += Utf8Field(KmlEscape(item.description.view()), kItemTextBuffer);
      out += "<br>]]></description><styleUrl>";
      out += kStyleUrl;
      out += "</styleUrl><Style><IconStyle><Icon><href>";
      out += kMarkerIcon;
      AppendPoint(out, item);
      return;
    }
    if (item.dataType != PHOTO_ITEM_INFO::kTypePhoto) return;
    const CString photoPath = item.GetFilePathName();
    if (photoPath.IsEmpty()) return;

    const std::string title = Utf8Field(KmlEscape(item.title.view()), kItemTextBuffer);
    const KmlPictureSize size = KmlDisplaySize(item.width, item.height);
    out += "\r\n<Placemark><name>";
    out += title;
    out += "</name><description><![CDATA[#";
    out += title;
    out += "<br><br><br>";
    out += KmlPhotoTimeText(item);
    // The letters stay "N" and "E" in every hemisphere; the signed numbers carry the truth.
    out += "<br>N ";
    AppendFixed(out, item.latitude, 6);
    out += ", E ";
    AppendFixed(out, item.longitude, 6);
    out += "<br><br><div class=\"pict\"><img class=\"pict\" width=\"";
    AppendInt(out, size.width);
    out += "\" height=\"";
    AppendInt(out, size.height);
    out += "\" hspace=\"5\" src=\"";
    out += PictureSource(item, photoPath);
    out += "\" align=\"left\" border=\"1\"></img></div>]]></description><styleUrl>";
    out += kStyleUrl;
    out += "</styleUrl><Style><IconStyle><Icon><href>";
    out += kPhotoIcon;
    AppendPoint(out, item);
  }

  static void AppendPoint(std::string& out, const PHOTO_ITEM_INFO& item) {
    out += "</href></Icon></IconStyle></Style><Point><coordinates>";
    AppendFixed(out, item.longitude, 6);
    out += ',';
    AppendFixed(out, item.latitude, 6);
    out += ",0</coordinates></Point></Placemark>";
  }

  std::string PictureSource(const PHOTO_ITEM_INFO& item, const CString& photoPath) {
    if (kmz_) {
      ++photoNumber_;
      const CString extension = PathExtension(photoPath);
      const CString name = extension.IsEmpty()
                               ? FormatString(L"%d", photoNumber_)
                               : FormatString(L"%d.%s", photoNumber_, extension.c_str());
      const CString copy = PathJoin(scratch_, name);
      // A copy that fails is still listed: packing it then fails and names the photo.
      navmisc::ClearFileRefusal();
      const bool copied = CopyFile(photoPath, copy, false);
      pack_.push_back({copy, &item, copied ? std::string() : navmisc::LastFileRefusal()});
      return Utf8Field(name.view(), kPathBuffer);
    }
    CString source;
    if (photoSourceMode_ == 1) source = item.originalName;
    else if (photoSourceMode_ == 2) source = item.url.url[0];
    if (photoSourceMode_ == 2 && !source.IsEmpty()) return Utf8Field(source.view(), kPathBuffer);
    if (source.IsEmpty()) source = photoPath;
    source.Replace(L'\\', L'/');
    // "file:///" already holds the root's slash.
    std::wstring_view rest = source.view();
    if (!rest.empty() && rest.front() == L'/') rest.remove_prefix(1);
    return "file:///" + Utf8Field(rest, kPathBuffer);
  }

  CPtrList& tracks_;
  CPtrList& items_;
  int photoSourceMode_ = 0;
  ExportControl& control_;
  Progress progress_;
  bool kmz_ = false;
  bool stopped_ = false;
  CString scratch_;
  int photoNumber_ = 0;
  std::vector<PackEntry> pack_;
};

int Fail(KmzExportFailure& failure, KmzExportFailure::Stage stage, const PackEntry* entry,
         const std::string& message) {
  failure.stage = stage;
  if (entry) {
    failure.file = entry->path;
    failure.photo = entry->photo;
  }
  failure.message = CString::FromUtf8(message);
  return 0;
}

int PackKmz(const CString& path, CPtrList& tracks, CPtrList& items, KmzExportFailure& failure,
            ExportControl& control) {
  navmisc::ScopedTempFolder scratch(L"KMZ_Temp");
  if (scratch.path().IsEmpty()) {
    return Fail(failure, KmzExportFailure::kScratchFolder, nullptr,
                "cannot create a scratch folder under $TMPDIR");
  }
  KmlWriter writer(tracks, items, 0, control);
  writer.SetKmz(scratch.path());
  if (!writer.Write(path)) {
    if (writer.stopped()) return Fail(failure, KmzExportFailure::kStopped, nullptr, "stopped");
    return Fail(failure, KmzExportFailure::kDocument, nullptr, control.error);
  }
  // A document that lost bytes on the way is still packed, as a whole one would be; the caller
  // learns of it from the control.
  const std::string documentError = control.error;

  // The document travels last, named after the target.
  PackEntry document{PathJoin(scratch.path(), PathFileTitle(path) + L".kml"), nullptr, {}};
  const bool copied = CopyFile(path, document.path, false);
  ClearTargetFile(path);
  if (!copied) {
    return Fail(failure, KmzExportFailure::kAddFile, &document, "cannot copy the written document");
  }
  std::vector<PackEntry>& pack = writer.pack();
  pack.push_back(document);

  navmisc::ZipArchiveWriter archive;
  if (!archive.Create(path)) return Fail(failure, KmzExportFailure::kArchive, nullptr, archive.error());
  for (const PackEntry& entry : pack) {
    if (!archive.AddFile(entry.path, PathFileName(entry.path))) {
      const std::string why = entry.refused.empty() ? archive.error() : entry.refused;
      // The archive keeps what was added before the failure.
      archive.Close();
      return Fail(failure, KmzExportFailure::kAddFile, &entry, why);
    }
  }
  if (!archive.Close()) {
    return Fail(failure, KmzExportFailure::kCloseArchive, nullptr, archive.error());
  }
  control.error = documentError;
  return 1;
}

}  // namespace

int ExportKml(CString path, CPtrList& tracks, CPtrList& items, int photoSourceMode) {
  ExportControl control;
  return ExportKml(path, tracks, items, photoSourceMode, control);
}

int ExportKml(CString path, CPtrList& tracks, CPtrList& items, int photoSourceMode, ExportControl& control) {
  KmlWriter writer(tracks, items, photoSourceMode, control);
  return writer.Write(path) ? 1 : 0;
}

int ExportKmz(CString path, CPtrList& tracks, CPtrList& items) {
  ExportControl control;
  return ExportKmz(path, tracks, items, nullptr, control);
}

int ExportKmz(CString path, CPtrList& tracks, CPtrList& items, KmzExportFailure* failure,
              ExportControl& control) {
  KmzExportFailure local;
  if (!failure) failure = &local;
  *failure = KmzExportFailure{};
  const int result = PackKmz(path, tracks, items, *failure, control);
  if (!result) control.error = failure->message.ToUtf8();
  return result;
}
