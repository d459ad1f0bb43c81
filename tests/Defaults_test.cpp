#include "Varnek_Config.h"
#include "support/VarnekTest.h"

namespace {

class DefaultsAlone : public VarnekTest {};

TEST_F(DefaultsAlone, FilesSayWhatTheirCommentsPromise) {
    const std::string debug = "debug_ltn.ini";
    const std::string config = "Varnek_Config.cfg";
    for (const std::string &name : {debug, config}) {
        WriteAll(VARNEK_DATA_DIR + name, ReadAll(VARNEK_DEFAULTS + name));
    }
    TakeLog();
    VarnekPGL_InitializeDebug();
    EXPECT_THAT(TakeBodies("SBTVD"),
                ::testing::ElementsAre("Log Config: Error=[1]\tHigh=[0]\tMid=[0]\tLow=[0]\n",
                                       "Log Config: Common=[1]\tJNI=[1]\tMainControl=[1]\tESG=[1]\tSessionManager=[1]",
                                       "Log Config: TS Demux=[1]\tCPRM Player=[1]\tSMPlayer =[1]\tSectionParser=[1]",
                                       "Log Config: DsmccDC=[1]\tDsmccOC=[1]\tGinga=[1]"));
    VARNEK_TRACE(VARNEK_LEVEL_ERROR | VARNEK_MODULE_COMMON, "through");
    EXPECT_THAT(TakeErrors(), ::testing::ElementsAre("through"));

    VarnekCfg_GetConfigInfo()->cprmPlayerDelay = 1;
    VarnekCfg_LoadConfigFile();
    VarnekCfg_SaveConfigFile();
    EXPECT_EQ(ReadAll(VARNEK_DATA_DIR + config),
              "CONFIG_CURRENTAREANAME=\nCONFIG_STANDARDTYPE=2\nCONFIG_TSCAPTURE=0\nCONFIG_TSFILESIMUL=0\n"
              "CONFIG_CPRMPLAYER_DELAY=68\nCONFIG_SUPPORT_NATION=BRA\n");
}

}  // namespace
