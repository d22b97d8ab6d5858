#include "navmisc/activity/tracker_store.h"

#include "navmisc/activity/detail/calendar_store_impl.h"

template class navmisc::activity::CalendarStore<_TrackerItem, TRACKER_DATA_NODE>;
template class navmisc::activity::CalendarDay<_TrackerItem, TRACKER_DATA_NODE>;
template class navmisc::activity::CalendarMonth<_TrackerItem, TRACKER_DATA_NODE>;
