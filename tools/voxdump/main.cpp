// voxdump: prints the records of a result file (or of an engine thread's temporary file),
// one per line, with the record kinds named and their fields decoded. A file that is cut
// short or corrupt is printed up to the fault, followed by where the fault is; the exit code
// is then 2.
#include <cstdio>
#include <iostream>
#include <optional>
#include <string>

#include <CLI/CLI.hpp>

#include "record_json.h"
#include "result_reader.h"

int main(int argc, char** argv) {
  CLI::App app{"Print the records of a vox result file"};
  std::string path;
  bool json = false;
  std::optional<int> kind;
  app.add_option("RESULTFILE", path, "result file or thread file")->required();
  app.add_flag("--json", json, "one JSON object per record");
  app.add_option("--kind", kind, "print only records of this kind")->check(CLI::Range(0, 255));
  CLI11_PARSE(app, argc, argv);

  const vox::tools::ReadResult result = vox::tools::ReadResultFile(path);
  vox::tools::RecordDescriber describer;
  for (const vox::tools::Record& record : result.records) {
    // Every record is described, also when filtered out, so plot epochs know their lines.
    const vox::tools::Json d = describer.Describe(record);
    if (kind && *kind != record.kind) continue;
    std::cout << (json ? d.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace)
                       : vox::tools::TextLine(d))
              << '\n';
  }
  if (!result.fault) return 0;
  if (json) {
    vox::tools::Json fault{
        {"fault", {{"offset", result.fault->offset}, {"expected", result.fault->what}}}};
    std::cout << fault.dump(-1, ' ', false, nlohmann::json::error_handler_t::replace) << '\n';
  } else {
    std::cout << "fault at offset " << result.fault->offset << ": expected " << result.fault->what
              << '\n';
  }
  std::cout.flush();
  std::fprintf(stderr, "voxdump: %s: fault at offset %llu\n", path.c_str(),
               static_cast<unsigned long long>(result.fault->offset));
  return 2;
}
