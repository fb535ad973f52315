// Tropospheric delay: Saastamoinen zenith delays from a standard atmosphere at the receiver's
// height, mapped to the elevation with a simple continued-fraction mapping function. Good to
// a decimetre at low elevations, which is what a code solution or a short baseline needs.
#pragma once

namespace voxeng {

struct Weather {
  double pressure = 1013.25;  // hPa at the receiver
  double temperature = 15.0;  // degrees Celsius
  double humidity = 50.0;     // percent
};

// Standard atmosphere reduced to a height (m above the ellipsoid, treated as above sea level).
Weather StandardWeather(double height);

// Zenith delays in metres.
double ZenithHydrostatic(const Weather& w, double lat, double height);
double ZenithWet(const Weather& w);

// Slant delay (m) at elevation `elevation` (rad); below 2 degrees the mapping is held there.
double TroposphereDelay(double lat, double height, double elevation);

}  // namespace voxeng
