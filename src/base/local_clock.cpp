// The local clock as calendar and GPS week time; kept apart from the pure conversions so that
// they can be used without the clock.
#include "base/gps_time.h"
#include "platform/platform.h"

namespace vox {

CalendarTime LocalCalendar() {
  const platform::LocalDateTime now = platform::LocalClock();
  return MakeCalendarFromDate(now.second, now.minute, now.hour, now.day, now.month, now.year);
}

GpsWeekTime LocalGpsWeekTime() {
  return CalendarToWeek(LocalCalendar());
}

}  // namespace vox
