#include "job/occupation_records.h"

#include <cstddef>
#include <cstring>
#include <type_traits>

#include "base/sat.h"
#include "job/record_text.h"

namespace vox {
namespace {

uint32_t IdOrZero(const auto* item) {
  return item != nullptr ? item->id : 0;
}

// The occupation's own epoch interval: the file's interval stretched by the epoch gap.
uint32_t OccupationInterval(const TOccupItem& occupation) {
  const uint32_t file_interval = occupation.file->epoch_interval_ms;
  return occupation.epoch_gap != 0 ? file_interval * occupation.epoch_gap : file_interval;
}

void FillSignals(const TChainItem& file, vox_OccupationData& record) {
  for (int s = 0; s < 2; ++s)
    record.signal_masks[s] = AbsentSignalsPlain(file.signal_masks[s]);
}
void FillSignals(const TChainItem& file, vox_OccupationDataEx& record) {
  uint32_t masks[5];
  for (int s = 0; s < 5; ++s)
    masks[s] = AbsentSignalsExtended(file.signal_masks[s]);
  StoreAt(record, offsetof(vox_OccupationDataEx, signal_masks), masks, sizeof(masks));
}

// The steps both record forms share; their fields carry the same names.
template <typename Record>
bool FillOccupation(const JobModel& job, const TOccupItem& occupation, Record& record) {
  const uint32_t request = record.mask;
  std::memset(&record, 0, sizeof(record));
  record.occupation_id = occupation.id;
  record.id = occupation.id;
  record.receiver_id = IdOrZero(occupation.receiver);
  record.point_id = IdOrZero(occupation.point);
  record.file_id = IdOrZero(occupation.file);
  record.file_id2 = record.file_id;
  if (occupation.file == nullptr) return false;
  const TChainItem& file = *occupation.file;

  record.first_epoch = occupation.first_epoch;
  record.last_epoch = occupation.last_epoch;
  uint32_t filled = 0;
  if ((request & (VOX_OCC_ANTENNA | VOX_OCC_ANTENNA_ALT)) != 0 && occupation.antenna != nullptr) {
    if constexpr (std::is_same_v<Record, vox_OccupationData>) {
      FillAntennaData(*occupation.antenna, record.antenna);
    } else {
      FillAntennaDataEx(*occupation.antenna, record.antenna);
    }
  }
  if ((request & VOX_OCC_L1_OFFSETS) != 0) {
    record.l1_offset[0] = static_cast<float>(occupation.l1_up);
    record.l1_offset[1] = static_cast<float>(occupation.l1_east);
    record.l1_offset[2] = static_cast<float>(occupation.l1_north);
    filled |= VOX_OCC_ANTENNA_ALT | VOX_OCC_L1_OFFSETS;
  }
  // A negative humidity (the job's default -1) means the job gave no meteorological values.
  if ((request & VOX_OCC_METEO) != 0 && occupation.humidity >= 0) {
    record.meteo_present = 1;
    record.temperature = occupation.temperature;
    record.humidity = occupation.humidity;
    record.pressure = occupation.pressure;
    record.meteo_height = occupation.meteo_height;
    filled |= VOX_OCC_METEO | VOX_OCC_METEO_FILLED;
  }
  record.epoch_interval_ms = OccupationInterval(occupation);
  record.epoch_interval_ms2 = record.epoch_interval_ms;
  record.epoch_count = occupation.epoch_count;
  record.max_satellites = file.max_satellites;
  record.file_interval_ms = file.epoch_interval_ms;
  filled |= VOX_OCC_EPOCHS;
  if ((request & VOX_OCC_SAT_STATES) != 0) {
    if constexpr (std::is_same_v<Record, vox_OccupationData>) {
      uint16_t states[2][5];
      FillSatelliteStates(job, states);
      StoreAt(record, offsetof(Record, sat_states), states, sizeof(states));
    } else {
      uint32_t states[5][4];
      FillSatelliteStatesEx(job, states);
      StoreAt(record, offsetof(Record, sat_states), states, sizeof(states));
    }
    filled |= VOX_OCC_SAT_STATES;
  }
  if ((request & VOX_OCC_SIGNALS) != 0) {
    FillSignals(file, record);
    filled |= VOX_OCC_SIGNALS | VOX_OCC_SIGNALS_FILLED;
  }
  if ((request & VOX_OCC_NAME) != 0) {
    CopyRecordText(record.name, occupation.name);
    filled |= VOX_OCC_NAME;
  }
  record.mask = filled;
  return true;
}

// Sets two-bit state `state` of satellite `number` in a table of `Word`s.
template <typename Word, size_t N>
void SetState(Word (&table)[N], unsigned number, unsigned state) {
  constexpr unsigned kPerWord = sizeof(Word) * 4;
  if (number / kPerWord >= N) return;
  const unsigned shift = 2 * (number % kPerWord);
  Word& word = table[number / kPerWord];
  word = static_cast<Word>((word & ~(Word{3} << shift)) | (Word(state) << shift));
}

template <typename Word, size_t N>
void FillStates(const JobModel& job, Word (*tables)[N], int systems) {
  for (int s = 0; s < systems; ++s) {
    for (unsigned n = 0; n < N * sizeof(Word) * 4; ++n)
      if (IsValidSatellite(static_cast<SatSystem>(s), n)) SetState(tables[s], n, VOX_SAT_USABLE);
  }
  const uint32_t count = job.omit_count < kSatIndexCount ? job.omit_count : kSatIndexCount;
  for (uint32_t i = 0; i < count; ++i) {
    const SatId sat = job.omit_list[i];
    const int system = static_cast<int>(SystemOf(sat));
    if (system < systems) SetState(tables[system], NumberOf(sat), VOX_SAT_EXCLUDED);
  }
}

template <typename Record>
void FillAntennaCommon(const TAntennItem& antenna, Record& record) {
  std::memset(&record, 0, sizeof(record));
  record.id = antenna.id;
  record.type_word = antenna.type_word;
  record.l2_offset[0] = static_cast<float>(antenna.l2_up);
  record.l2_offset[1] = static_cast<float>(antenna.l2_east);
  record.l2_offset[2] = static_cast<float>(antenna.l2_north);
}

template <typename Record>
void StorePattern(Record& record, const TAntennItem& antenna, int slot) {
  constexpr size_t kBlock = sizeof(antenna.patterns[0]);
  StoreAt(record, offsetof(Record, patterns) + kBlock * static_cast<size_t>(slot),
          antenna.patterns[slot], kBlock);
}

}  // namespace

bool FillOccupationData(const JobModel& job, const TOccupItem& occupation,
                        vox_OccupationData& record) {
  return FillOccupation(job, occupation, record);
}

bool FillOccupationDataEx(const JobModel& job, const TOccupItem& occupation,
                          vox_OccupationDataEx& record) {
  return FillOccupation(job, occupation, record);
}

void FillAntennaData(const TAntennItem& antenna, vox_AntennaData& record) {
  FillAntennaCommon(antenna, record);
  for (int slot = 0; slot < 4; ++slot)
    if ((antenna.pattern_mask & (1u << slot)) != 0) StorePattern(record, antenna, slot);
}

void FillAntennaDataEx(const TAntennItem& antenna, vox_AntennaDataEx& record) {
  FillAntennaCommon(antenna, record);
  for (int slot = 0; slot < kPatternSlots; ++slot) {
    if ((antenna.pattern_mask & (1u << slot)) == 0) continue;
    StorePattern(record, antenna, slot);
    record.pattern_mask |= 1u << slot;
    record.slot_count = static_cast<uint32_t>(slot) + 1;
  }
}

void FillReceiverData(uint32_t id, const TReceiverItem& receiver, vox_ReceiverData& record) {
  record.id = id;
  CopyRecordText(record.vendor, receiver.vendor);
  CopyRecordText(record.name, receiver.name);
  CopyRecordText(record.serial, receiver.serial);
}

void FillLinkedOccupation(const TOccupItem& occupation, vox_ROccupData& record) {
  std::memset(&record, 0, sizeof(record));
  record.occupation_id = occupation.id;
  record.occupation_id2 = occupation.id;
  record.occupation_id3 = occupation.id;
  record.point_id = IdOrZero(occupation.point);
  if (occupation.file != nullptr) {
    record.file_id = occupation.file->id;
    record.file_id2 = occupation.file->id;
  }
}

TROccupItem* LinkedOccupations(const JobModel& job, uint32_t item_id, uint32_t selector) {
  if (selector != 0) {
    const TVectorItem* vector = job.FindVector(item_id);
    return vector != nullptr ? vector->occupations.head() : nullptr;
  }
  const TFanItem* fan = job.FindFan(item_id);
  return fan != nullptr ? fan->occupations.head() : nullptr;
}

uint8_t AbsentSignalsPlain(uint32_t signal_mask) {
  // Codes of L1C, L1P, L2C and their phases (file bits 0, 1, 2 and 5, 6, 7).
  const uint32_t present = (signal_mask & 0x7) | ((signal_mask >> 2) & 0x38);
  return static_cast<uint8_t>(~present);
}

uint32_t AbsentSignalsExtended(uint32_t signal_mask) {
  uint32_t pairs = 0;
  for (int k = 0; k < 5; ++k) {
    pairs |= ((signal_mask >> k) & 1u) << (2 * k);
    pairs |= ((signal_mask >> (k + 5)) & 1u) << (2 * k + 1);
  }
  return pairs ^ 0x3FF;
}

void FillSatelliteStates(const JobModel& job, uint16_t (&states)[2][5]) {
  std::memset(states, 0, sizeof(states));
  FillStates(job, states, 2);
}

void FillSatelliteStatesEx(const JobModel& job, uint32_t (&states)[5][4]) {
  std::memset(states, 0, sizeof(states));
  FillStates(job, states, 5);
}

}  // namespace vox
