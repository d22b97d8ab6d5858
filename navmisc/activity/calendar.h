// The calendar of an activity store: months holding days holding the day's activities. The
// sport and the tracker stores instantiate it with their own item and store classes.
//
// Ownership: the store owns its months, a month its days, a day its activities. Rectangles are
// set by the calendar view and only tested here.
#pragma once

#include "navmisc/platform/lists.h"
#include "navmisc/platform/types.h"

namespace navmisc::activity {

template <class Item, class Store>
class CalendarMonth;

template <class Item, class Store>
class CalendarDay {
 public:
  CalendarDay() = default;
  // Copies the plain fields (day, count, rectangle, month), never the activities.
  CalendarDay(const CalendarDay& other) { *this = other; }
  CalendarDay& operator=(const CalendarDay& other) {
    if (this != &other) {
      day = other.day;
      count = other.count;
      rect = other.rect;
      month = other.month;
    }
    return *this;
  }
  // Deletes the day's activities.
  virtual ~CalendarDay();

  int day = 0;     // of the month, 1..31
  CPtrList items;  // Item*, owned; by the trips' UTC start, equal starts in the order added
  int count = 0;   // number of activities
  CRect rect;
  CalendarMonth<Item, Store>* month = nullptr;
};

template <class Item, class Store>
class CalendarMonth {
 public:
  CalendarMonth() = default;
  // Copies the plain fields (year, month, rectangle, store), never the days.
  CalendarMonth(const CalendarMonth& other) { *this = other; }
  CalendarMonth& operator=(const CalendarMonth& other) {
    if (this != &other) {
      year = other.year;
      month = other.month;
      rect = other.rect;
      store = other.store;
    }
    return *this;
  }
  // Deletes the days.
  virtual ~CalendarMonth();

  int year = 0;
  int month = 0;  // 1..12
  CPtrList days;  // CalendarDay<Item, Store>*, owned; by day of the month
  CRect rect;
  Store* store = nullptr;
};

}  // namespace navmisc::activity
