#include "navmisc/activity/sport_store.h"

#include <mutex>

#include "navmisc/activity/detail/calendar_store_impl.h"
#include "navmisc/platform/resources.h"

CString g_szSportViewTexts[2];

SPORT_DATA_NODE::SPORT_DATA_NODE() {
  static std::once_flag loaded;
  std::call_once(loaded, [] {
    g_szSportViewTexts[0] = LoadResString(9653);
    g_szSportViewTexts[1] = LoadResString(9654);
  });
}

SPORT_DATA_NODE::SPORT_DATA_NODE(const SPORT_DATA_NODE& other) : SPORT_DATA_NODE() {
  userName = other.userName;
}

template class navmisc::activity::CalendarStore<_SportItem, SPORT_DATA_NODE>;
template class navmisc::activity::CalendarDay<_SportItem, SPORT_DATA_NODE>;
template class navmisc::activity::CalendarMonth<_SportItem, SPORT_DATA_NODE>;
