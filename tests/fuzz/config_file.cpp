// The configuration file: the record that a load makes, against a reading of the file by other
// means, and unchanged by saving it and loading it again. What follows a 0 is the feature store's
// text.
#include <algorithm>
#include <cctype>
#include <cstring>

#include "Fuzz.h"
#include "Varnek_Config.h"

namespace {

// A value by the key's place in the file; the last of several lines counts.
using Values = std::vector<std::string>;

Values ValuesOf(const std::string &text) {
    static const char *const keys[] = {"config_currentareaname=", "config_standardtype=",     "config_tscapture=",
                                       "config_tsfilesimul=",     "config_cprmplayer_delay=", "config_support_nation="};
    Values values(6);
    for (size_t at = 0; at < text.size();) {
        const size_t end = std::min(text.find_first_of("\r\n", at), text.size());
        const std::string line = text.substr(at, std::min<size_t>(end - at, 254));
        std::string folded = line;
        std::transform(folded.begin(), folded.end(), folded.begin(),
                       [](char c) { return c >= 'A' && c <= 'Z' ? static_cast<char>(c + 32) : c; });
        for (size_t key = 0; key < 6; ++key) {
            const size_t found = folded.find(keys[key]);
            if (found != std::string::npos) {
                values[key] = line.substr(found + strlen(keys[key]));
                break;
            }
        }
        at = end + 1;
    }
    return values;
}

int32_t Number(const std::string &text) {
    const long number = strtol(text.c_str(), nullptr, 10);
    return static_cast<int32_t>(std::clamp<long>(number, INT32_MIN, INT32_MAX));
}

std::string Nation(const std::string &value, const std::string &feature) {
    if (!value.empty()) {
        return value.substr(0, 99);
    }
    const size_t tag = feature.find("NATION:");
    const std::string code = tag != std::string::npos ? feature.substr(tag + 7, 3) : "";
    return code.size() == 3 && code.find_first_of("\r\n") == std::string::npos ? code : "BRA";
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    static const DataFile file("Varnek_Config.cfg");
    Input input(data, size);
    const std::string text = input.Text().data();
    const std::vector<char> feature = input.Text();
    gFeature = feature.data();
    file.Write(text);
    const Values values = ValuesOf(text);

    VarnekConfigInfo *const info = VarnekCfg_GetConfigInfo();
    VarnekCfg_LoadConfigFile();
    CHECK(info->currentAreaName == values[0].substr(0, 99));
    CHECK(info->standardType == Number(values[1]));
    CHECK(info->tsCaptureEnable == static_cast<uint8_t>(Number(values[2])));
    CHECK(info->tsFileSimulEnable == static_cast<uint8_t>(Number(values[3])));
    CHECK(info->cprmPlayerDelay == Number(values[4]));
    CHECK(info->supportNation == Nation(values[5], gFeature));
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
