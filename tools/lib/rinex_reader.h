// Readers of RINEX observation files (versions 2.10, 2.11 and 3.0x) and navigation files
// (version 2 GPS, GLONASS and SBAS files, version 3 single-system and mixed files), for the
// tools that turn receiver exchange files into raw observation files.
//
// The readers only read: they give the header, then one epoch or one navigation record per
// call, with the values as the file states them (times in the file's own time scale, values
// in the file's units). What the values mean for our raw records is the converter's business.
//
// Every fault of the text (a line cut short, a number that is not a number, an epoch line
// without its satellites) throws RinexError with the file name and the 1-based line number.
// Not thread-safe: one reader per thread.
#pragma once

#include <array>
#include <cstdint>
#include <fstream>
#include <map>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace voxtools::rinex {

// "file:line: what", or "file: what" for faults of the file as a whole (line 0).
class RinexError : public std::runtime_error {
 public:
  RinexError(const std::string& file, int line, const std::string& what);
  int line() const { return line_; }

 private:
  int line_;
};

// A calendar time as a RINEX file writes it, in the file's time scale.
struct RinexTime {
  int year = 0, month = 0, day = 0, hour = 0, minute = 0;
  double second = 0;
};

// Seconds since 1980-01-06 00:00:00 of the same time scale (no leap seconds applied).
double SecondsSinceGpsOrigin(const RinexTime& t);
// GPS minus UTC at a UTC time given as seconds since the GPS origin, from the table of
// announced leap seconds (1981 to 2017); 0 before the first.
int LeapSecondsAt(double utc_seconds);

// Two-digit years of version 2 files: 80 to 99 are 1980 to 1999, the rest 2000 to 2079.
int FullYear(int year);

struct ObsHeader {
  double version = 0;
  char system = 'G';  // the file's system letter: G, R, E, C, J, S or M (mixed)
  std::string marker_name;
  std::string observer, agency;
  std::string receiver_number, receiver_type, receiver_version;
  std::optional<std::array<double, 3>> approx_position;
  double interval = 0;                // seconds; 0 when the header does not say
  std::string time_system = "GPS";    // of TIME OF FIRST OBS: GPS, GLO, GAL, BDT, QZS
  std::optional<int> leap_seconds;    // LEAP SECONDS, when given
  std::vector<std::string> types_v2;  // version 2: one list for every system
  std::map<char, std::vector<std::string>> types_v3;  // version 3: per system letter
};

struct ObsValue {
  double value = 0;
  bool present = false;  // blank and 0.000 fields are absent
  uint8_t lli = 0;       // loss-of-lock indicator digit (0 when blank)
  uint8_t strength = 0;  // signal strength digit (0 when blank)
};

struct SatObservations {
  char system = 'G';
  unsigned number = 0;
  std::vector<ObsValue> values;  // in the order of ObsReader::TypesOf(system)
};

struct ObsEpoch {
  RinexTime time;
  int flag = 0;  // 0 or 1 (power failure before this epoch); event epochs are not returned
  std::vector<SatObservations> sats;
  int line = 0;  // line of the epoch's first line
};

// What both readers share: the file, its line counter for messages, and the first header
// line with the format version.
class RinexFile {
 protected:
  // Opens the file; throws RinexError when it cannot.
  explicit RinexFile(const std::string& path);
  bool GetLine(std::string& line);
  [[noreturn]] void Fail(const std::string& what) const;
  // Reads the first line, "RINEX VERSION / TYPE", and returns the version (2.x or 3.x) and the
  // line itself for its type fields; throws RinexError.
  double ReadVersionLine(std::string& line);

  std::string path_;
  std::ifstream in_;
  int line_no_ = 0;
};

class ObsReader : private RinexFile {
 public:
  // Opens the file and reads its header; throws RinexError.
  explicit ObsReader(const std::string& path);

  const ObsHeader& header() const { return header_; }
  // The observation types of a system as three-character codes of version 3 ("C1C", "L2W",
  // "S1C"); version 2 types are translated for the system (see TranslateV2Type).
  const std::vector<std::string>& TypesOf(char system);
  // The next epoch with observations; false at the end of the file. Event epochs (flags 2 to
  // 5) are skipped, taking any header lines they carry; cycle-slip records (flag 6) are
  // skipped. Throws RinexError.
  bool Next(ObsEpoch& epoch);

 private:
  void ReadHeader();
  void HeaderLine(const std::string& line, int& pending_types, char& types_system);
  void ReadSatValues(SatObservations& sat, const std::string& first_part, bool v3);
  bool NextV2(ObsEpoch& epoch);
  bool NextV3(ObsEpoch& epoch);
  void SkipLines(int count);

  ObsHeader header_;
  std::map<char, std::vector<std::string>> translated_;
};

// A version 2 observation type ("C1", "P2", "L1", "S2") as the version 3 code it stands for
// in the given system, knowing the file's whole list of version 2 types (a phase takes the
// attribute of the code it goes with). Empty for types we do not carry (D, T).
std::string TranslateV2Type(const std::string& type, char system,
                            const std::vector<std::string>& all_types);

struct NavHeader {
  double version = 0;
  char system = 'G';  // G, R, S, E, C, J or M (mixed)
  std::optional<int> leap_seconds;
};

// One broadcast record: the satellite, its epoch (toc) and every number of the record in
// file order: the three clock numbers of the first line, then four per following line.
struct NavRecord {
  char system = 'G';
  unsigned number = 0;
  RinexTime toc;
  std::vector<double> values;
  int line = 0;
};

class NavReader : private RinexFile {
 public:
  explicit NavReader(const std::string& path);

  const NavHeader& header() const { return header_; }
  // The next record; false at the end of the file. Records of systems the reader does not
  // know (for example IRNSS) are skipped by their number of lines. Throws RinexError.
  bool Next(NavRecord& record);

 private:
  void ReadHeader();
  int OrbitLines(char system) const;

  NavHeader header_;
};

}  // namespace voxtools::rinex
