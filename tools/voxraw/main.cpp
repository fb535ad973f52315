// voxraw dump FILE [--json]: every record of a raw observation file, decoded, with offsets.
// voxraw info FILE [--json]: what the scan learns from the file.
// voxraw from-rinex OBS NAV... -o OUT: a raw observation file from RINEX files.
#include <CLI/CLI.hpp>

#include "from_rinex.h"
#include "voxraw.h"

int main(int argc, char** argv) {
  CLI::App app{"Look inside raw observation files and precise orbit files"};
  app.require_subcommand(1);
  std::string path;
  bool json = false;
  CLI::App* dump = app.add_subcommand("dump", "print every record decoded, with its offset");
  dump->add_option("FILE", path, "raw observation or precise orbit file")->required();
  dump->add_flag("--json", json, "print JSON");
  CLI::App* info = app.add_subcommand("info", "print what the scan learns from the file");
  info->add_option("FILE", path, "raw observation or precise orbit file")->required();
  info->add_flag("--json", json, "print JSON");
  voxraw::AddFromRinex(app);  // runs and ends the parse with its own exit code
  CLI11_PARSE(app, argc, argv);
  if (dump->parsed()) return voxraw::Dump(path, json);
  return voxraw::Info(path, json);
}
