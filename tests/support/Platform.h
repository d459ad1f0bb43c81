// Stands in for the device's log and feature store in tests, fuzz targets and the soak, and checks that each line keeps
// to the platform's contract.
#ifndef VARNEK_TESTS_SUPPORT_PLATFORM_H
#define VARNEK_TESTS_SUPPORT_PLATFORM_H

// The files of the library: settings, the debug configuration in use, and the one that the system comes with.
constexpr char kSettingsFile[] = VARNEK_DATA_DIR "Varnek_Config.cfg";
constexpr char kDebugFile[] = VARNEK_DATA_DIR "debug_ltn.ini";
constexpr char kShippedDebugFile[] = VARNEK_SYSTEM_DIR "debug_ltn.ini";

// Called for each line of the log in the thread that writes it; null for none.
extern void (*gOnLog)(int priority, const char *tag, const char *text);

// Returns the caller's text of a trace, without the prefix, and other lines as a whole.
const char *BodyOf(const char *tag, const char *text);

// The feature store's text for the nation; null for a platform without the feature.
extern const char *gFeature;

// Empties the library's data directory, apart from a debug configuration that turns everything on. Several processes
// may do so at once.
void StartClean();

// Empties the data directory, so that other programs of the build do not trace.
void LeaveClean();

#endif
