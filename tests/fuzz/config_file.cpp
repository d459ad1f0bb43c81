// The configuration file: any text loads, and saving the settings and loading them again changes nothing. After a 0
// comes what the feature store says.
#include <cstring>

#include "Fuzz.h"
#include "Varnek_Config.h"

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    WriteInPlace(kSettingsFile, input.Text().data());
    const std::vector<char> feature = input.Text();
    gFeature = feature.data();

    VarnekConfigInfo *const info = VarnekCfg_GetConfigInfo();
    VarnekCfg_LoadConfigFile();
    CHECK(strnlen(info->currentAreaName, 100) < 100 && strnlen(info->supportNation, 100) < 100);
    CHECK(info->supportNation[0] != '\0');
    CHECK(VarnekCfg_IsSupportBML() == (strncmp(info->supportNation, "PHL", 3) == 0 ? TRUE : FALSE));

    VarnekConfigInfo saved;
    memcpy(&saved, info, sizeof saved);
    VarnekCfg_SaveConfigFile();
    VarnekCfg_LoadConfigFile();
    CHECK(strcmp(saved.currentAreaName, info->currentAreaName) == 0);
    CHECK(saved.standardType == info->standardType && saved.cprmPlayerDelay == info->cprmPlayerDelay);
    CHECK(saved.tsCaptureEnable == info->tsCaptureEnable && saved.tsFileSimulEnable == info->tsFileSimulEnable);
    CHECK(strcmp(saved.supportNation, info->supportNation) == 0);
    return 0;
}
