#include "Varnek_Config.h"
#include "support/VarnekTest.h"

namespace {

class DefaultsAlone : public VarnekTest {};

TEST_F(DefaultsAlone, FilesSayWhatTheirCommentsPromise) {
    WriteAll(kDebugFile, ReadAll(TestFile("defaults/debug_ltn.ini")));
    WriteAll(kSettingsFile, ReadAll(TestFile("defaults/Varnek_Config.cfg")));
    NOTE(VarnekPGL_InitializeDebug)();
    VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON, "through");
    Note("an error of the library", "");
    VarnekCfg_GetConfigInfo()->cprmPlayerDelay = 1;
    VarnekCfg_LoadConfigFile();
    VarnekCfg_SaveConfigFile();
    Note(ReadAll(kSettingsFile));
}

}  // namespace
