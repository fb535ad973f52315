#include "job/omit_sv.h"

#include "base/engine_log.h"
#include "job/job_section.h"

namespace vox {

namespace {

struct Letter {
  char letter;
  SatSystem system;
  int32_t first, last;  // valid numbers
  int32_t offset;       // added to the stored number
};

// QZSS satellites ("J") are stored as GPS 33 to 37.
constexpr Letter kLetters[] = {
    {'G', SatSystem::kGps, 1, 37, 0},     {'J', SatSystem::kGps, 1, 5, 32},
    {'R', SatSystem::kGlonass, 1, 24, 0}, {'C', SatSystem::kBds, 1, 37, 0},
    {'E', SatSystem::kGalileo, 1, 30, 0}, {'S', SatSystem::kSbas, 20, 40, 0},
};

const Letter* FindLetter(char c) {
  for (const Letter& l : kLetters)
    if (l.letter == c) return &l;
  return nullptr;
}

}  // namespace

uint32_t ParseOmitList(std::string_view value, std::string_view section_name,
                       SatId (&list)[kSatIndexCount]) {
  uint32_t count = 0;
  if (value.empty()) return 0;
  for (std::string_view item : SplitCommaList(value)) {
    size_t pos = 0;
    while (pos < item.size() && (item[pos] == ' ' || item[pos] == '\t'))
      ++pos;
    const char letter = pos < item.size() ? item[pos] : '\0';
    const std::string_view rest = pos < item.size() ? item.substr(pos + 1) : std::string_view();
    const Letter* system = FindLetter(letter);
    const int32_t number = ParseIntBlankTolerant(rest);
    if (system == nullptr || number < system->first || number > system->last ||
        count >= kSatIndexCount) {
      Trace("Invalid sv index: %.*s in section: [%.*s]\n", static_cast<int>(rest.size()),
            rest.data(), static_cast<int>(section_name.size()), section_name.data());
      continue;
    }
    list[count++] = MakeSatId(system->system, static_cast<unsigned>(number + system->offset));
  }
  return count;
}

}  // namespace vox
