/// @file
/// The receiver's persistent settings: one record in the process, and "Varnek_Config.cfg" in the
/// data directory with one KEY=value line for each field.
///
/// The record starts with the values below. Loading replaces all of it: a field that the file does
/// not set becomes 0 or empty, and an empty nation is then filled in as VarnekCfg_GetSupportNation
/// does. Not thread-safe: whoever loads, sets or saves must keep all others away from the record.
/// @see [Guide: configuration](docs/guide/configuration.md)
#ifndef VARNEK_CONFIG_H
#define VARNEK_CONFIG_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// The settings. Texts end in a NUL and contain no line breaks. Changing a field does not save it.
typedef struct VarnekConfigInfo {
    char currentAreaName[100];  ///< defined by the callers
    int32_t standardType;       ///< defined by the callers; 0 is "not loaded"; initially 2
    uint8_t tsCaptureEnable;    ///< 0 is off
    uint8_t tsFileSimulEnable;  ///< 0 is off
    int32_t cprmPlayerDelay;    ///< initially 68
    char supportNation[100];    ///< three-letter code
} VarnekConfigInfo;

/// Returns the process's record, without loading the file; never null.
VARNEK_API VarnekConfigInfo *VarnekCfg_GetConfigInfo(void);

/// Loads the file. A key may be in upper or lower case and anywhere in a line. Lines are cut to 254
/// characters and values to 99; a number beyond 32 bits becomes the nearest that fits, and a switch
/// takes the low 8 bits. The record stays as it is if the file cannot be read, is not a regular one
/// or is larger than 1 MiB.
VARNEK_API void VarnekCfg_LoadConfigFile(void);

/// Saves the record in the data directory, which must exist; failures are traced. The text goes
/// into a draft beside the file ("Varnek_Config.new." and numbers), is flushed to the medium and
/// renamed over the file, so that readers find the old text or the new one, whatever happens to the
/// process or the power. The file keeps its mode and group, but not access control lists and other
/// attributes. It is overwritten in place instead, and can then be caught half-written, if there is
/// no room or permission for a draft, or if it is a symbolic link, has a second name (hard link),
/// belongs to another user or to a group that a draft cannot be given, or is not a regular file. A
/// write-protected file stays as it is, unless root saves over another user's.
VARNEK_API void VarnekCfg_SaveConfigFile(void);

/// Sets the standard type, and saves the record when the type changes.
VARNEK_API void VarnekCfg_SetStandard(int32_t std);

/// Returns a field. This getter and the next two load the file first while `standardType` is 0.
VARNEK_API int32_t VarnekCfg_GetStandard(void);
VARNEK_API uint8_t VarnekCfg_GetTSCaptueEnable(void);     ///< as VarnekCfg_GetStandard
VARNEK_API uint8_t VarnekCfg_GetTSFileSimulEnable(void);  ///< as VarnekCfg_GetStandard

/// Returns the nation, never empty. If the record has none, this first sets it to the one in the
/// platform's feature store or, without one there, to "BRA".
VARNEK_API const char *VarnekCfg_GetSupportNation(void);

/// Says whether the receiver shows BML data broadcasts: TRUE if the nation is "PHL".
VARNEK_API BOOL VarnekCfg_IsSupportBML(void);

#ifdef __cplusplus
}
#endif

#endif
