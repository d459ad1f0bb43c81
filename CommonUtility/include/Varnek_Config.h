// The receiver's persistent settings: one record of the process and its file, "Varnek_Config.cfg"
// in the data directory, with one KEY=value line per field.
//
// The record starts with the initial values below. A load replaces all of it: what the file does
// not give becomes 0 or empty, and the nation then comes from the platform's feature store. The
// three getters that say so load the file first while `standardType` is 0. There is no lock:
// callers that load, set or save while other threads use the record take turns.
#ifndef VARNEK_CONFIG_H
#define VARNEK_CONFIG_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

// Texts are NUL-terminated and hold no line ends. Callers may change fields; nothing is saved then.
typedef struct VarnekConfigInfo {
    char currentAreaName[100];  // the callers' text
    int32_t standardType;       // the callers' code; 0 is "not loaded"; initially 2
    uint8_t tsCaptureEnable;    // 0 is off
    uint8_t tsFileSimulEnable;  // 0 is off
    int32_t cprmPlayerDelay;    // initially 68
    char supportNation[100];    // three-letter code
} VarnekConfigInfo;

// Gives access to the record, without a load.
//   returns  the record of the process, never null
VARNEK_API VarnekConfigInfo *VarnekCfg_GetConfigInfo(void);

// Loads the file. Keys match without case and anywhere in a line; lines beyond 254 characters and
// values beyond 99 are cut, numbers beyond 32 bits are the nearest that fits, and the switches take
// a number's low 8 bits. A file that cannot be opened or read leaves the record as it is, and so
// does one that is no regular file or larger than 1 MiB.
VARNEK_API void VarnekCfg_LoadConfigFile(void);

// Saves the record; the data directory must exist. A failure is traced. The new text is written
// beside the file ("Varnek_Config.new"), flushed to the medium and renamed into place with the mode
// of the old file: a reader finds the old text or the new one, whenever the process is killed.
// Where that cannot be (no room or no permission for a second file; a second process that saves for
// longer than a second; a link, another user's file or no regular file in its place), the file
// itself is emptied and written.
VARNEK_API void VarnekCfg_SaveConfigFile(void);

// Sets the standard type, and saves when it is another one.
VARNEK_API void VarnekCfg_SetStandard(int32_t std);

// Read a field. These three load the file first while `standardType` is 0.
VARNEK_API int32_t VarnekCfg_GetStandard(void);
VARNEK_API uint8_t VarnekCfg_GetTSCaptueEnable(void);
VARNEK_API uint8_t VarnekCfg_GetTSFileSimulEnable(void);

// Asks the feature store while the record has no nation.
//   returns  the record's nation, never empty: "BRA" unless file or platform say otherwise
VARNEK_API const char *VarnekCfg_GetSupportNation(void);

// Whether the receiver shows BML data broadcasts.
//   returns  TRUE when the nation is "PHL"
VARNEK_API BOOL VarnekCfg_IsSupportBML(void);

#ifdef __cplusplus
}
#endif

#endif
