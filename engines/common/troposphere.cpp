#include "troposphere.h"

#include <algorithm>
#include <cmath>

#include "geodesy.h"

namespace voxeng {

Weather StandardWeather(double height) {
  const double h = std::clamp(height, -500.0, 9000.0);
  Weather w;
  w.pressure = 1013.25 * std::pow(1.0 - 2.2557e-5 * h, 5.2568);
  w.temperature = 15.0 - 6.5e-3 * h;
  w.humidity = 50.0 * std::exp(-6.396e-4 * h);
  return w;
}

double ZenithHydrostatic(const Weather& w, double lat, double height) {
  return 0.0022768 * w.pressure / (1.0 - 0.00266 * std::cos(2 * lat) - 0.00028e-3 * height);
}

double ZenithWet(const Weather& w) {
  const double t = w.temperature + 273.15;
  const double e = 6.108 * w.humidity / 100.0 * std::exp((17.15 * t - 4684.0) / (t - 38.45));
  return 0.0022768 * (1255.0 / t + 0.05) * e;
}

double TroposphereDelay(double lat, double height, double elevation) {
  const Weather w = StandardWeather(height);
  const double el = std::max(elevation, 2.0 * kDeg);
  const double s = std::sin(el);
  // Chao-style mapping: close to 1/sin(el) high up, bounded near the horizon.
  const double dry = 1.0 / (s + 0.00143 / (std::tan(el) + 0.0445));
  const double wet = 1.0 / (s + 0.00035 / (std::tan(el) + 0.017));
  return ZenithHydrostatic(w, lat, height) * dry + ZenithWet(w) * wet;
}

}  // namespace voxeng
