// voxdemo-report RESULT TRUTH [NMEA...]: prints the demo's report (see demo_report.h). Exit
// code 0, or 1 for bad arguments or an unreadable truth file, 2 for a faulty result file.
#include <iostream>

#include "demo_report.h"

int main(int argc, char** argv) {
  if (argc < 3) {
    std::cerr << "usage: voxdemo-report RESULT TRUTH [NMEA...]\n";
    return 1;
  }
  voxdemo::Truth truth;
  if (!voxdemo::ReadTruth(argv[2], truth)) {
    std::cerr << "voxdemo-report: cannot read " << argv[2] << "\n";
    return 1;
  }
  const std::vector<std::string> nmea(argv + 3, argv + argc);
  return voxdemo::Report(vox::tools::ReadResultFile(argv[1]), truth, nmea, std::cout) ? 0 : 2;
}
