#include "Varnek_Config.h"
#include "support/VarnekTest.h"

namespace {

class DefaultsAlone : public VarnekTest {};

TEST_F(DefaultsAlone, FilesSayWhatTheirCommentsPromise) {
    const std::string debug = "debug_ltn.ini";
    const std::string config = "Varnek_Config.cfg";
    for (const std::string &name : {debug, config}) {
        WriteAll(VARNEK_DATA_DIR + name, ReadAll(TestFile("defaults/" + name)));
    }
    NOTE(VarnekPGL_InitializeDebug)();
    VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON, "through");
    Note("an error of the library", "");
    VarnekCfg_GetConfigInfo()->cprmPlayerDelay = 1;
    VarnekCfg_LoadConfigFile();
    VarnekCfg_SaveConfigFile();
    Note(ReadAll(VARNEK_DATA_DIR + config));
}

}  // namespace
