// Writes the seed corpora of the fuzz targets: small valid inputs built with the same writers
// the test suite uses (raw observation files in both byte orders and both epoch record kinds,
// precise orbit files, job texts, result and thread files), plus a few cut and damaged
// variants, so that the fuzzers start from inputs that reach deep into each reader.
//
// Usage: vox_fuzz_seeds <folder>; creates <folder>/<target>/ for each target.
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "raw_writer.h"
#include "results/result_file.h"

namespace fs = std::filesystem;
using voxtools::RawOrder;
using voxtools::RawSatellite;
using voxtools::RawSignal;
using voxtools::RawWriter;

namespace {

constexpr uint32_t kDay = 13204;  // 2016-03-14

void Save(const fs::path& folder, const std::string& name, const std::vector<uint8_t>& bytes) {
  fs::create_directories(folder);
  std::ofstream(folder / name, std::ios::binary)
      .write(reinterpret_cast<const char*>(bytes.data()),
             static_cast<std::streamsize>(bytes.size()));
}
void SaveText(const fs::path& folder, const std::string& name, const std::string& text) {
  Save(folder, name, std::vector<uint8_t>(text.begin(), text.end()));
}

RawSatellite Sat(uint8_t tag, char system, unsigned number, unsigned signals, double base) {
  RawSatellite s;
  s.code = tag == 8 ? voxtools::SatCode8(system, number) : voxtools::SatCode51(system, number);
  static const uint8_t kCodes51[] = {16, 20, 32, 36, 82};
  for (unsigned i = 0; i < signals; ++i) {
    const double code = base + 1000.0 * i, phase = base * 5.25 + 17.0 * i;
    s.signals.push_back(tag == 8 ? RawSignal::Tag8(i % 4, code, phase)
                                 : RawSignal::Tag51(kCodes51[i % 5], code, phase));
  }
  return s;
}

// A file of every record kind the scan knows, epochs of tag 8 or 51 at 1 s.
RawWriter RawFile(RawOrder order, uint8_t tag, const char* time_system, unsigned epochs) {
  RawWriter w(order);
  w.Header('O').Receiver("REC", "1.0", "SN123", "ANT", "NONE");
  w.TimeRef(time_system, {0, kDay}, {}, 17);
  voxtools::RawGpsEphemeris gps;
  gps.number = 5;
  gps.time = {3600000, kDay};
  gps.g8 = 5153.7;
  w.GpsEphemeris(gps);
  voxtools::RawGlonassEphemeris glo;
  glo.slot = 3;
  glo.time = {900000, kDay};
  glo.position[0] = 12000.0;
  w.GlonassEphemeris(glo);
  voxtools::RawSatPosition pos;
  pos.code = tag == 8 ? voxtools::SatCode8('G', 7) : voxtools::SatCode51('G', 7);
  pos.time = {0, kDay};
  pos.position[0] = 20000.0;
  w.SatPosition(pos, tag == 8 ? 23 : 56);
  w.MeteoSensor(1, 1013.0f, "baro", "x");
  voxtools::RawMeteoSample meteo;
  meteo.time = {1000, kDay};
  meteo.pressure = 1013.2f;
  meteo.temperature = 15.0f;
  w.MeteoSample(meteo);
  for (unsigned e = 0; e < epochs; ++e) {
    std::vector<RawSatellite> sats;
    sats.push_back(Sat(tag, 'G', 1 + e % 3, 3, 2.0e7 + e));
    sats.push_back(Sat(tag, 'R', 4, 2, 2.1e7 + e));
    if (tag == 51) sats.push_back(Sat(tag, 'E', 11, 3, 2.3e7 + e));
    if (tag == 51) sats.push_back(Sat(tag, 'C', 21, 2, 2.4e7 + e));
    w.Epoch(tag, 1000 * (e + 1), sats);
    if (e == epochs / 2) w.TimeRef(time_system, {1000 * (e + 1), kDay}, {}, 17);
  }
  w.EndOfData();
  return w;
}

void RawSeeds(const fs::path& out) {
  int n = 0;
  for (RawOrder order : {RawOrder::kLittle, RawOrder::kBig})
    for (uint8_t tag : {uint8_t{8}, uint8_t{51}})
      for (const char* system : {"GPS", "UTC"}) {
        const RawWriter w = RawFile(order, tag, system, 6);
        for (const char* target : {"scan", "epochs"}) {
          Save(out / target, "raw_" + std::to_string(n), w.bytes());
          // The same file cut inside its last epoch record.
          std::vector<uint8_t> cut(w.bytes().begin(), w.bytes().end() - 9);
          Save(out / target, "raw_cut_" + std::to_string(n), cut);
        }
        ++n;
      }
  // A bare header and a file with only an end record.
  RawWriter bare;
  bare.Header('O').EndOfData();
  Save(out / "scan", "raw_bare", bare.bytes());
}

std::string Sp3(char version, int epochs, bool glonass) {
  std::string text;
  char line[128];
  std::snprintf(line, sizeof line, "#%cP%4d %2d %2d %2d %2d %11.8f %7d ORBIT IGS05 HLM  IGS",
                version, 2010, 7, 1, 0, 0, 0.0, epochs);
  text += std::string(line) + "\n";
  text += "## 1590 345600.00000000   900.00000000 55378 0.0000000000000\n";
  text += glonass ? "+    3   G01G02R03\n" : "+    2   G01G02\n";
  text += "++         0  2\n%c G  cc GPS ccc\n/* seed\n";
  for (int e = 0; e < epochs; ++e) {
    std::snprintf(line, sizeof line, "*  2010  7  1 %2d %2d %11.8f", e / 4, (e % 4) * 15, 0.0);
    text += std::string(line) + "\n";
    for (int s = 1; s <= (glonass ? 3 : 2); ++s) {
      std::snprintf(line, sizeof line, "P%c%02d%14.6f%14.6f%14.6f%14.6f", s == 3 ? 'R' : 'G', s,
                    15000.0 + e + s, -12000.5 - s, 18000.25 * s, 12.5 + s);
      text += std::string(line) + "\n";
    }
  }
  return text + "EOF\n";
}

void Sp3Seeds(const fs::path& out) {
  SaveText(out / "sp3", "sp3c", Sp3('c', 4, true));
  SaveText(out / "sp3", "sp3a", Sp3('a', 2, false));
  SaveText(out / "sp3", "sp3_short", Sp3('b', 6, false).substr(0, 400));
#ifdef VOX_SHARED_DIR
  // The start of real orbit files (headers of the real width and padding).
  for (const char* name : {"igs15904.sp3", "esa15253.sp3"}) {
    std::ifstream in(fs::path(VOX_SHARED_DIR) / "data/gnss" / name);
    std::string text, line;
    for (int i = 0; i < 80 && std::getline(in, line); ++i)
      text += line + "\n";
    if (!text.empty()) SaveText(out / "sp3", std::string("real_") + name, text);
  }
#endif
}

void JobSeeds(const fs::path& out) {
  const std::string full =
      "[JOB]\r\nName=Seed $(NAME)\r\nType=1\r\nEnginePath=static.eng\r\nResultPath=r.res\r\n"
      "AutoIncrementResultPath=1\r\nNumCPUs=2\r\nStart=1900:0\r\nEnd=1901:86400\r\n"
      "OmitSV=G01,R03,E11\r\nProcessControlFlags=3\r\nResultVersion=101\r\n"
      "NumPoints=2\r\nNumAntennas=1\r\nNumReceivers=1\r\nNumFiles=2\r\nNumOccups=2\r\n"
      "NumVectors=1\r\nNumFans=1\r\n"
      "[POINT:1]\r\nName=P1\r\nPosX=-3976219.5\r\nPosY=3382372.5\r\nPosZ=3652512.9\r\nPosRms=0."
      "1\r\n"
      "[POINT:2]\r\nName=P2\r\nPosX=0x10\r\n"
      "[ANTENNA:1]\r\nName=A\r\nOffsetL1_U=0.1\r\nOffsetL2_U=0.12\r\nDirPat_GPS_L1=1,2,3\r\n"
      "[RECEIVER:1]\r\nName=R\r\nVendor=V\r\nSN=1\r\n"
      "[FILE:1]\r\nName=$(ROOT)/a.raw\r\nSmooth=1\r\nTemp=0\r\n[FILE:2]\r\nName=b.sp3\r\n"
      "[OCCUP:1]\r\nName=O1\r\nPoint=1\r\nFile=1\r\nAntenna=1\r\nReceiver=1\r\nStart=1900:10\r\n"
      "End=1900:3600\r\nEpochGap=5\r\nGGAPath=o1.nmea\r\nPressure=1013\r\nTemperature=15\r\n"
      "Humidity=50\r\nMeteoHeight=2\r\n"
      "[OCCUP:2]\r\nName=O2\r\nPoint=2\r\nFile=1\r\n"
      "[VECTOR:1]\r\nPoints=1,2\r\nOccup=1,2\r\nElevation=15\r\n"
      "[FAN:1]\r\nPoint=1\r\nRover=2\r\nOccup=1,2\r\nStartPoint=1\r\n"
      "[STATIC]\r\nElevation=10\r\n"
      "[LEAP_SEC]\r\nNum=2\r\n0=2006.0\r\n1=2009.0\r\n";
  SaveText(out / "job", "full", full);
  SaveText(out / "job", "multisite",
           "[JOB]\nType=2\nMultisite=1\nMaxExtraBases=3\nEnginePath=kin.eng\n"
           "RunRawFilterOnly=0\nRawfiltPath=filter.dll\nEnableReoccupations=1\nNumPoints=3\n"
           "NumOccups=3\nNumFiles=1\n[FILE:1]\nName=a.raw\n[POINT:2]\nName=P2\nPosX=10\n"
           "[OCCUP:1]\nPoint=2\nFile=1\n[OCCUP:2]\nPoint=2\nFile=1\n[OCCUP:3]\nPoint=1\n"
           "[STATIC]\nElevation=10\nStartPoint=2\n");
  SaveText(out / "job", "leap", "[JOB]\nName=x\n[LEAP_SEC]\nNum=3\n0=1980.0\n1=1981.5\n2=abc\n");
  SaveText(out / "job", "vars", "[JOB]\nName=$(EMPTY)$(NAME)$(UNKNOWN)\nResultPath=$(ROOT\n");
}

// A thread or result file with a record of each common kind.
std::vector<uint8_t> ResultFile(const fs::path& path, bool with_end) {
  vox::TResultFile f(path.string());
  f.Open();
  f.WriteMessage("seed message", 0x11);
  f.WriteMessage("nested", 0x22);
  uint8_t payload[200] = {};
  for (size_t i = 0; i < sizeof payload; ++i)
    payload[i] = static_cast<uint8_t>(i * 7);
  f.WriteRecord(vox::kKindSolutionStart, payload, 8);
  f.WriteRecord(vox::kKindVector, payload, 104);
  f.WriteRecord(vox::kKindRay, payload, 64);
  f.WriteRecord(vox::kKindSatelliteA, payload, 16);
  f.WriteRecord(vox::kKindPlotEpochV101, payload, 20);
  f.WriteRecord(200, payload, 3);
  if (with_end) {
    f.Close();
  } else {
    // What a thread leaves when it never gets to close its file.
    f.Close();
    fs::resize_file(path, fs::file_size(path) - 5);
  }
  std::ifstream in(path, std::ios::binary);
  return {std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>()};
}

void ResultSeeds(const fs::path& out) {
  const fs::path scratch = out / "scratch.res";
  const auto whole = ResultFile(scratch, true);
  const auto cut = ResultFile(scratch, false);
  fs::remove(scratch);
  for (const char* target : {"append", "result_reader"}) {
    Save(out / target, "whole", whole);
    Save(out / target, "cut", cut);
    Save(out / target, "header_only", std::vector<uint8_t>(whole.begin(), whole.begin() + 15));
  }
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 2) {
    std::fprintf(stderr, "usage: %s <corpus folder>\n", argv[0]);
    return 2;
  }
  const fs::path out = argv[1];
  fs::create_directories(out);
  RawSeeds(out);
  Sp3Seeds(out);
  JobSeeds(out);
  ResultSeeds(out);
  return 0;
}
