#include "navmisc/export/kml_export.h"

#include <zip.h>

#include <clocale>
#include <cstdlib>
#include <ctime>
#include <cwchar>
#include <string>
#include <vector>

#include "navmisc/export/detail/export_common.h"
#include "navmisc/export/detail/kml_common.h"
#include "navmisc/platform/files.h"
#include "navmisc/platform/textconv.h"
#include "navmisc/records/photo.h"
#include "navmisc/records/track.h"
#include "navmisc/records/trip.h"

namespace navmisc::exportdetail {

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

std::string KmlDocumentName(std::time_t now) {
  std::tm local{};
  localtime_r(&now, &local);
  // The user's own date and time conventions (LC_TIME from the environment), not the
  // process's current locale.
  locale_t loc = newlocale(LC_TIME_MASK, "", static_cast<locale_t>(0));
  if (!loc) loc = newlocale(LC_TIME_MASK, "C", static_cast<locale_t>(0));
  wchar_t buf[256];
  size_t n = 0;
  if (loc) {
    locale_t previous = uselocale(loc);
    n = std::wcsftime(buf, sizeof buf / sizeof buf[0], L"%x %X", &local);
    uselocale(previous);
    freelocale(loc);
  }
  return Utf8Field(std::wstring_view(buf, n), 512);
}

KmlPictureSize KmlDisplaySize(int width, int height) {
  constexpr int kBox = 320;
  if (width <= 0 || height <= 0) return {kBox, kBox * 3 / 4};
  if (width >= height) {
    return {kBox, static_cast<int>((static_cast<long long>(height) * kBox + width / 2) / width)};
  }
  return {static_cast<int>((static_cast<long long>(width) * kBox + height / 2) / height), kBox};
}

}  // namespace navmisc::exportdetail

namespace {

using namespace navmisc::exportdetail;

constexpr std::string_view kStyleUrl =
    "#default_copy0+nicon=http://maps.google.com/mapfiles/kml/pal4/icon15.png"
    "+hicon=http://maps.google.com/mapfiles/kml/pal4/icon7.png";
constexpr std::string_view kMarkerIcon = "http://maps.google.com/mapfiles/kml/pal3/icon36.png";
constexpr std::string_view kPhotoIcon = "http://maps.google.com/mapfiles/kml/pal4/icon38.png";

// Text buffers of the original readers of these documents, terminator included.
constexpr size_t kTrackNameBuffer = 1024;
constexpr size_t kItemTextBuffer = 20480;
constexpr size_t kPathBuffer = 2048;

// A file to put into the archive, and the photo it is a copy of (null for the document).
struct PackEntry {
  CString path;
  const PHOTO_ITEM_INFO* photo = nullptr;
};

// Writes one document; lives for one export call.
class KmlWriter {
 public:
  KmlWriter(const CString& path, CPtrList& tracks, CPtrList& items, int photoSourceMode)
      : path_(path), tracks_(tracks), items_(items), photoSourceMode_(photoSourceMode) {}

  // Photos are then copied into `scratchFolder` and referred to by their bare copy names.
  void SetKmz(const CString& scratchFolder) {
    kmz_ = true;
    scratch_ = scratchFolder;
    pack_.clear();
  }
  std::vector<PackEntry>& pack() { return pack_; }

  bool Write() {
    if (path_.IsEmpty()) return false;
    ClearTargetFile(path_);
    file_ = OpenForWriting(path_);
    if (!file_) return false;
    {
      BufferedWriter w(file_.get());
      std::string& out = w.text();
      out += "<?xml version=\"1.0\" encoding=\"UTF-8\"?><kml xmlns=\"http://earth.google.com/kml/2.1\">"
             "<Folder><name>";
      out += KmlDocumentName(std::time(nullptr));
      out += "</name><open>1</open>";
      for (const TRACK_ITEM_INFO* track : navmisc::Items<TRACK_ITEM_INFO>(tracks_)) {
        if (track) WriteTrack(w, *track);
      }
      for (const PHOTO_ITEM_INFO* item : navmisc::Items<PHOTO_ITEM_INFO>(items_)) {
        if (item) WriteItem(out, *item);
        w.MaybeFlush();
      }
      out += "</Folder></kml>";
    }
    file_.reset();
    return true;
  }

 private:
  void WriteTrack(BufferedWriter& w, const TRACK_ITEM_INFO& track) {
    std::string& out = w.text();
    // Track names go out raw, and the description repeats the name.
    std::string name = Utf8Field(track.GetName().view(), kTrackNameBuffer);
    out += "<Placemark><name>";
    out += name;
    out += "</name><description>";
    out += name;
    out += "</description><styleUrl>";
    out += kStyleUrl;
    out += "</styleUrl><Style><LineStyle id=\"khLineStyle989\"><color>7f8000ff</color><width>4</width>"
           "</LineStyle></Style><LineString><tessellate>1</tessellate><coordinates>\r\n";
    for (const WAYPOINT_ITEM_INFO* p : navmisc::Items<WAYPOINT_ITEM_INFO>(track.points)) {
      if (!p || p->time == -1) continue;
      AppendFixed(out, p->longitude, 6);
      out += ',';
      AppendFixed(out, p->latitude, 6);
      out += ",0 ";
      w.MaybeFlush();
    }
    out += "</coordinates></LineString></Placemark>";
  }

  void WriteItem(std::string& out, const PHOTO_ITEM_INFO& item) {
    if (item.dataType == PHOTO_ITEM_INFO::kTypeMarker ||
        item.dataType == PHOTO_ITEM_INFO::kTypeLandmark) {
      std::string title = Utf8Field(KmlEscape(item.title.view()), kItemTextBuffer);
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
    CString photoPath = item.GetFilePathName();
    if (photoPath.IsEmpty()) return;

    std::string title = Utf8Field(KmlEscape(item.title.view()), kItemTextBuffer);
    KmlPictureSize size = KmlDisplaySize(item.width, item.height);
    out += "\r\n<Placemark><name>";
    out += title;
    out += "</name><description><![CDATA[#";
    out += title;
    out += "<br><br><br>";
    out += PhotoTimeText(item);
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

  // The photo's own time, else the camera's time brought to UTC by the trip's shift.
  static std::string PhotoTimeText(const PHOTO_ITEM_INFO& item) {
    if (item.playbackTime > 0) return StdTimeTextZ(item.playbackTime);
    if (item.originalTime > 0) {
      const int32_t shift = item.trip ? item.trip->timeZoneShift : 0;
      return StdTimeTextZ(static_cast<int32_t>(static_cast<int64_t>(item.originalTime) - shift));
    }
    return {};
  }

  std::string PictureSource(const PHOTO_ITEM_INFO& item, const CString& photoPath) {
    if (kmz_) {
      ++photoNumber_;
      CString extension = PathExtension(photoPath);
      CString name = extension.IsEmpty() ? FormatString(L"%d", photoNumber_)
                                         : FormatString(L"%d.%s", photoNumber_, extension.c_str());
      CString copy = PathJoin(scratch_, name);
      // A copy that fails is still listed: packing it then fails and names the photo.
      CopyFile(photoPath, copy, false);
      pack_.push_back({copy, &item});
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

  CString path_;
  UniqueFile file_;
  CPtrList& tracks_;
  CPtrList& items_;
  bool kmz_ = false;
  CString scratch_;
  int photoSourceMode_ = 0;
  int photoNumber_ = 0;
  std::vector<PackEntry> pack_;
};

// A scratch folder of this call's own, removed with everything in it when the object goes.
class ScratchFolder {
 public:
  ScratchFolder() {
    const char* tmp = std::getenv("TMPDIR");
    std::string base = (tmp && *tmp) ? tmp : "/tmp";
    std::string templ = base + "/navmisc-kmz-XXXXXX";
    if (!mkdtemp(templ.data())) return;
    own_ = navmisc::FromUtf8Lossy(templ);
    CString folder = PathJoin(own_, L"KMZ_Temp");
    if (MakeDir(folder)) folder_ = folder;
  }
  ~ScratchFolder() {
    if (!own_.IsEmpty()) RemoveDir(own_);
  }
  ScratchFolder(const ScratchFolder&) = delete;
  ScratchFolder& operator=(const ScratchFolder&) = delete;
  const CString& folder() const { return folder_; }  // empty when it could not be made

 private:
  CString own_;
  CString folder_;
};

int Fail(KmzExportFailure* failure, KmzExportFailure::Stage stage, const PackEntry* entry,
         const wchar_t* message) {
  if (failure) {
    failure->stage = stage;
    if (entry) {
      failure->file = entry->path;
      failure->photo = entry->photo;
    }
    failure->message = message;
  }
  return 0;
}

}  // namespace

int ExportKml(CString path, CPtrList& tracks, CPtrList& items, int photoSourceMode) {
  KmlWriter writer(path, tracks, items, photoSourceMode);
  return writer.Write() ? 1 : 0;
}

int ExportKmz(CString path, CPtrList& tracks, CPtrList& items) {
  return ExportKmz(path, tracks, items, nullptr);
}

int ExportKmz(CString path, CPtrList& tracks, CPtrList& items, KmzExportFailure* failure) {
  if (failure) *failure = KmzExportFailure{};
  ScratchFolder scratch;
  if (scratch.folder().IsEmpty()) {
    return Fail(failure, KmzExportFailure::kScratchFolder, nullptr,
                L"cannot create a scratch folder under $TMPDIR");
  }
  KmlWriter writer(path, tracks, items, 0);
  writer.SetKmz(scratch.folder());
  if (!writer.Write()) {
    return Fail(failure, KmzExportFailure::kDocument, nullptr, L"cannot write the document");
  }

  // The document travels last, named after the target.
  PackEntry document{PathJoin(scratch.folder(), PathFileTitle(path) + L".kml"), nullptr};
  if (!CopyFile(path, document.path, false)) {
    ClearTargetFile(path);
    return Fail(failure, KmzExportFailure::kAddFile, &document, L"cannot copy the document");
  }
  ClearTargetFile(path);
  std::vector<PackEntry>& pack = writer.pack();
  pack.push_back(document);

  int error = 0;
  zip_t* archive = zip_open(navmisc::NativePath(path).c_str(), ZIP_CREATE | ZIP_TRUNCATE, &error);
  if (!archive) {
    return Fail(failure, KmzExportFailure::kArchive, nullptr, L"cannot create the archive");
  }
  for (const PackEntry& entry : pack) {
    // libzip reads the files only when the archive is closed; a file that cannot be read now is
    // reported here, against its own name, rather than as a failed close.
    std::string native = navmisc::NativePath(entry.path);
    std::FILE* probe = std::fopen(native.c_str(), "rb");
    if (!probe) {
      zip_discard(archive);
      return Fail(failure, KmzExportFailure::kAddFile, &entry, L"cannot read the file to pack");
    }
    std::fclose(probe);
    zip_source_t* source = zip_source_file(archive, native.c_str(), 0, -1);
    std::string name = navmisc::ToUtf8Lossy(PathFileName(entry.path).view());
    if (!source || zip_file_add(archive, name.c_str(), source, ZIP_FL_ENC_UTF_8) < 0) {
      if (source) zip_source_free(source);
      zip_discard(archive);
      return Fail(failure, KmzExportFailure::kAddFile, &entry, L"cannot add the file to the archive");
    }
  }
  if (zip_close(archive) != 0) {
    zip_discard(archive);
    ClearTargetFile(path);
    return Fail(failure, KmzExportFailure::kCloseArchive, nullptr, L"cannot complete the archive");
  }
  return 1;
}
