// The platform as the tests, the fuzz targets and the soak see it. A program that is linked with this
// takes the place of the device's log and of its feature store, and of each line it checks that the
// platform's contract holds.
#ifndef VARNEK_TESTS_SUPPORT_PLATFORM_H
#define VARNEK_TESTS_SUPPORT_PLATFORM_H

// Called for each line of the log in the thread that writes it; null for none.
extern void (*gOnLog)(int priority, const char *tag, const char *text);

// The caller's text of a trace, behind its prefix. Other lines come back whole.
const char *BodyOf(const char *tag, const char *text);

// What the feature store gives for the nation; null for a platform without the feature.
extern const char *gFeature;

// Leaves in the library's data directory nothing but a debug configuration that turns everything on,
// whatever an earlier run left there. Several processes may do so at once.
void StartClean();

// Empties the data directory, so that other programs of the build are not loud.
void LeaveClean();

#endif
