/// @file
/// The receiver's persistent settings. The process has one record; its file is "Varnek_Config.cfg"
/// in the data directory, with one KEY=value line per field.
///
/// The record starts with the initial values below. A load replaces all of it: a field that the
/// file does not set becomes 0 or empty, and a missing nation comes from the platform's feature
/// store. Three getters load the file first while `standardType` is 0. Not thread-safe: a thread
/// that loads, sets or saves must exclude all other users of the record.
/// @see [Guide: configuration](docs/guide/configuration.md)
#ifndef VARNEK_CONFIG_H
#define VARNEK_CONFIG_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// Texts are NUL-terminated and contain no line breaks. Callers may change fields; that does not
/// save them.
typedef struct VarnekConfigInfo {
    char currentAreaName[100];  ///< defined by the callers
    int32_t standardType;       ///< defined by the callers; 0 is "not loaded"; initially 2
    uint8_t tsCaptureEnable;    ///< 0 is off
    uint8_t tsFileSimulEnable;  ///< 0 is off
    int32_t cprmPlayerDelay;    ///< initially 68
    char supportNation[100];    ///< three-letter code
} VarnekConfigInfo;

/// Gives access to the record without loading the file.
/// @return the record of the process, never null
VARNEK_API VarnekConfigInfo *VarnekCfg_GetConfigInfo(void);

/// Loads the file. A key may be in upper or lower case and anywhere in a line. Lines are truncated
/// to 254 characters and values to 99. A number beyond 32 bits becomes the nearest one that fits,
/// and a switch takes the low 8 bits of its number. When the file cannot be read, is not a regular
/// file or is larger than 1 MiB, the record stays unchanged.
VARNEK_API void VarnekCfg_LoadConfigFile(void);

/// Saves the record; the data directory must exist. A failure is traced. The new text is written to
/// a draft beside the file ("Varnek_Config.new." and a number), flushed to the medium and renamed
/// over it. So a reader finds either the old text or the new one, even if the process is killed
/// meanwhile. The mode and the group of the old file are kept; access control lists and other
/// attributes are lost. The text is written over the old one in place when there is no room or
/// permission for a draft, or when the file is a symbolic link, has a second name (hard link),
/// belongs to another user or is not a regular file. A file that its owner protected stays as it
/// is.
VARNEK_API void VarnekCfg_SaveConfigFile(void);

/// Sets the standard type, and saves the record when the type changes.
VARNEK_API void VarnekCfg_SetStandard(int32_t std);

/// Read a field. These three load the file first while `standardType` is 0.
VARNEK_API int32_t VarnekCfg_GetStandard(void);
VARNEK_API uint8_t VarnekCfg_GetTSCaptueEnable(void);     ///< as VarnekCfg_GetStandard
VARNEK_API uint8_t VarnekCfg_GetTSFileSimulEnable(void);  ///< as VarnekCfg_GetStandard

/// Returns the record's nation. When the record has none, it first sets the nation from the feature
/// store.
/// @return the nation, never empty; "BRA" when neither the file nor the feature store defines one
VARNEK_API const char *VarnekCfg_GetSupportNation(void);

/// Says whether the receiver shows BML data broadcasts.
/// @return TRUE when the nation is "PHL"
VARNEK_API BOOL VarnekCfg_IsSupportBML(void);

#ifdef __cplusplus
}
#endif

#endif
