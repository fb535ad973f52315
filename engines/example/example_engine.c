/* The example engine: reads every occupation's epochs and meteorological samples through
 * the vox streams and reports what it saw as messages in the result file. It computes
 * nothing; it shows the shape of an engine: the four required functions, one processing
 * call, the streams, the callbacks and the rule that nothing escapes an engine call. */
#include <stdio.h>
#include <string.h>

#include <vox/vox_engine.h>

#define EXAMPLE_MESSAGE_INFO 1u

VOX_ENGINE_EXPORT int32_t VOX_CALL _eng_GetEngineVOXVersion(void) {
  return VOX_ENGINE_INTERFACE_VERSION;
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineDLLVersion(void) {
  return 0x00010000u;
}
VOX_ENGINE_EXPORT const char* VOX_CALL _eng_GetEngineInternalName(void) {
  return "example";
}
VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_GetEngineCapability(void) {
  return 0;
}

/* Epochs, satellite records and L1 code values of one occupation. */
typedef struct {
  uint32_t epochs;
  uint32_t satellites;
  uint32_t l1_codes;
  TimeMs first;
} OccupationCount;

static int CountEpochs(uint32_t occupation_id, OccupationCount* count) {
  vox_EpochData epoch;
  vox_EpochSatData sat;
  int ok;
  void* stream = vox_OpenEpochStream(occupation_id, 0, NULL, NULL);
  if (stream == NULL) return 0;
  memset(count, 0, sizeof *count);
  for (ok = vox_FindEpoch(stream, NULL, &epoch); ok; ok = vox_GetNextEpoch(stream, &epoch)) {
    if (count->epochs++ == 0) {
      count->first.seconds = epoch.seconds;
      count->first.ms = epoch.ms;
    }
    while (vox_GetEpochDataEx(stream, &sat)) {
      ++count->satellites;
      /* Only values whose presence bit is set were written for this satellite. */
      if (sat.presence & (1u << (2 * VOX_SLOT_L1C))) ++count->l1_codes;
    }
  }
  vox_CloseEpochStream(stream);
  return 1;
}

static void Report(vox_ThreadContext* context, const char* text) {
  if (context->message != NULL) context->message(context->writer, EXAMPLE_MESSAGE_INFO, text);
}

VOX_ENGINE_EXPORT uint32_t VOX_CALL _eng_ProcessGroup(vox_ThreadContext* context) {
  vox_OccupationData occupation;
  char text[200];
  void* occupations = vox_OpenSolOccupStream();
  if (occupations == NULL) return 0; /* nothing to do is a failure for this engine */
  memset(&occupation, 0, sizeof occupation);
  while (vox_GetNextSolOccup(occupations, &occupation)) {
    OccupationCount count;
    if (!CountEpochs(occupation.occupation_id, &count)) continue;
    snprintf(text, sizeof text, "occupation %08X: %u epochs, %u satellites, %u L1 codes",
             (unsigned)occupation.occupation_id, (unsigned)count.epochs, (unsigned)count.satellites,
             (unsigned)count.l1_codes);
    Report(context, text);

    /* The file's meteorological samples, interpolated at the first epoch. */
    if (count.epochs > 0) {
      void* meteo = vox_OpenMeteoStream(occupation.file_id);
      vox_MeteoData m;
      if (meteo != NULL) {
        if (vox_GetMeteoData(meteo, &count.first, &m)) {
          snprintf(text, sizeof text, "  pressure %.1f hPa, temperature %.1f C", m.pressure,
                   m.temperature);
          Report(context, text);
        }
        vox_CloseMeteoStream(meteo);
      }
    }
  }
  vox_CloseSolOccupStream(occupations);
  if (context->progress != NULL) context->progress(context->writer, 100);
  return 1;
}
