// A point in time: whole seconds since 1970-01-01 00:00 UTC (value type).
#ifndef VLXTime_h
#define VLXTime_h

#include <ctime>

class VLXTime {
 public:
  VLXTime() = default;
  VLXTime(const VLXTime&) = default;
  VLXTime& operator=(const VLXTime&) = default;

  void Settime_t(time_t seconds) { _seconds = seconds; }
  time_t Gettime_t() const { return _seconds; }

  int operator==(const VLXTime& other) const { return _seconds == other._seconds; }
  int operator!=(const VLXTime& other) const { return _seconds != other._seconds; }

 private:
  time_t _seconds = 0;
};

#endif
