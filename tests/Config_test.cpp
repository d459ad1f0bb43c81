// Loading well-formed and hostile configuration files, saving, and where the nation comes from.
#include "Varnek_Config.h"

#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <array>
#include <cstring>
#include <filesystem>

#include "support/VarnekTest.h"

namespace {

class ConfigAlone : public VarnekTest {
  protected:
    // Loads this content, saves the settings and returns what was saved.
    static std::string Reloaded(const std::string &content) {
        WriteAll(kSettingsFile, content);
        VarnekCfg_LoadConfigFile();
        VarnekCfg_SaveConfigFile();
        return ReadAll(kSettingsFile);
    }
    void SetArea(const std::string &name) {
        memset(info_.currentAreaName, 0, sizeof info_.currentAreaName);
        name.copy(info_.currentAreaName, sizeof info_.currentAreaName - 1);
    }
    VarnekConfigInfo &info_ = *VarnekCfg_GetConfigInfo();
};

std::string File(const std::string &area, int64_t standard, int capture, int simulation, int64_t delay,
                 const std::string &nation) {
    return "CONFIG_CURRENTAREANAME=" + area + "\nCONFIG_STANDARDTYPE=" + std::to_string(standard) +
           "\nCONFIG_TSCAPTURE=" + std::to_string(capture) + "\nCONFIG_TSFILESIMUL=" + std::to_string(simulation) +
           "\nCONFIG_CPRMPLAYER_DELAY=" + std::to_string(delay) + "\nCONFIG_SUPPORT_NATION=" + nation + "\n";
}

TEST_F(ConfigAlone, SavesOnChangeAndLoadsOnDemand) {
    NOTE(VarnekCfg_LoadConfigFile)();
    NOTE(VarnekCfg_SetStandard)(2);
    EXPECT_FALSE(std::filesystem::exists(kSettingsFile)) << "the standard had not changed";
    NOTE(VarnekCfg_SetStandard)(-3);
    EXPECT_EQ(ReadAll(kSettingsFile), File("", -3, 0, 0, 68, ""));
    WriteAll(kSettingsFile, File("", 0, 1, 2, 0, "ARG"));
    NOTE(VarnekCfg_GetTSCaptueEnable)();
    info_.standardType = 0;
    NOTE(VarnekCfg_GetTSCaptueEnable)();
    info_.tsFileSimulEnable = 0;
    EXPECT_EQ(VarnekCfg_GetTSFileSimulEnable(), 2);
    WriteAll(kSettingsFile, File("", 7, 0, 0, 0, "ARG"));
    EXPECT_EQ(VarnekCfg_GetStandard(), 7);
}

TEST_F(ConfigAlone, LinesAreTracedAsTheyAreRead) {
    const std::string file = "config_standardtype= +3x\r\n#nothing\n\rxCONFIG_TSCAPTURE=1\n";
    WriteAll(kSettingsFile, file);
    NOTE(VarnekCfg_LoadConfigFile)();
    EXPECT_EQ(Reloaded(file), File("", 3, 1, 0, 0, "BRA"));
}

TEST_F(ConfigAlone, AnyFileLoads) {
    const std::string type = "CONFIG_STANDARDTYPE=", area = "CONFIG_CURRENTAREANAME=";
    const std::string nation = "CONFIG_SUPPORT_NATION=", cut(99, 'x'), none = File("", 0, 0, 0, 0, "BRA");
    const std::string good = File("S\xC3\xA3o Paulo\t", 3, 1, 255, -5, "ARG");
    const auto ofType = [](int64_t standard) { return File("", standard, 0, 0, 0, "BRA"); };
    const auto many = [](char c, size_t count) { return std::string(count, c); };
    const struct {
        std::string file, expected;
    } rows[] = {
        {good, good},
        {"\n" + good.substr(0, good.size() - 1), good},
        {type + "7\n" + good, good},
        {"", none},
        {type.substr(0, 19), none},
        {type + "5\n" + area + many('x', 100), File(cut, 5, 0, 0, 0, "BRA")},
        {nation + many('x', 100000) + "\n" + type + "4", File("", 4, 0, 0, 0, cut)},
        // Only 254 characters of a line are read.
        {many('x', 233) + type + "51", ofType(5)},
        {many('x', 235) + type + "51", none},
        {type + "99999999999999999999", ofType(INT32_MAX)},
        {type + "-99999999999999999999", ofType(INT32_MIN)},
        {"CONFIG_TSCAPTURE=257\nCONFIG_TSFILESIMUL=-1", File("", 0, 1, 255, 0, "BRA")},
        {type + "5\n" + many('\0', 1) + type + "6", ofType(5)},
        {many('\n', (1 << 20) - 21) + type + "8", ofType(8)},
        {many('\n', (1 << 20) - 20) + type + "9", ofType(8)},  // more than 1 MiB, which is not read
        {type + "9\r" + many('\xFF', 1 << 19) + "\r" + type + "10", ofType(10)},
    };
    for (const auto &row : rows) {
        EXPECT_EQ(Reloaded(row.file), row.expected) << row.file.substr(0, 300);
    }
    memset(info_.currentAreaName, 'x', sizeof info_.currentAreaName);
    memset(info_.supportNation, 'x', sizeof info_.supportNation);
    info_.standardType = info_.cprmPlayerDelay = INT32_MIN;
    VarnekCfg_SaveConfigFile();
    EXPECT_EQ(ReadAll(kSettingsFile), File(cut, INT32_MIN, 0, 0, INT32_MIN, cut));
}

TEST_F(ConfigAlone, AnUnreadableFileLeavesTheSettings) {
    const std::function<void()> makers[] = {
        [] { std::filesystem::create_directory(kSettingsFile); },
        [] { mkfifo(kSettingsFile, 0666); },
        [] { WriteAll(kSettingsFile, std::string((1 << 20) + 1, '\n')); },
    };
    for (const auto &make : makers) {
        make();
        VarnekCfg_LoadConfigFile();
        EXPECT_EQ(TakeBodies().back(), "  VarnekCfg_LoadConfigFile : Cannot Read Config File!");
        EXPECT_EQ(info_.cprmPlayerDelay, 68);
        std::filesystem::remove(kSettingsFile);
    }
}

TEST_F(ConfigAlone, ASaveKeepsTheModeAndTheLinks) {
    const std::string other = std::filesystem::absolute(Path("other"));
    WriteAll(kSettingsFile, "");
    chmod(kSettingsFile, 0640);
    const bool mayChange = chown(kSettingsFile, static_cast<uid_t>(-1), 1234) == 0;  // only root may
    VarnekCfg_SaveConfigFile();
    struct stat saved = {};
    EXPECT_EQ(stat(kSettingsFile, &saved), 0);
    EXPECT_TRUE(saved.st_gid == 1234 || !mayChange);
    EXPECT_EQ(std::filesystem::status(kSettingsFile).permissions(), static_cast<std::filesystem::perms>(0640));
    for (const bool hard : {true, false}) {
        std::filesystem::remove(kSettingsFile);
        WriteAll(other, "");
        EXPECT_EQ((hard ? link : symlink)(other.c_str(), kSettingsFile), 0);
        VarnekCfg_SaveConfigFile();
        EXPECT_EQ(ReadAll(other), File("", 2, 0, 0, 68, "")) << "the save did not write to the linked file";
    }
}

TEST_F(ConfigAlone, TheNationComesFromFileThenPlatformThenDefault) {
    const std::pair<const char *, const char *> rows[] = {
        {nullptr, "BRA"},       {"", "BRA"},
        {"nation:PHL", "BRA"},  {"NATION:PH", "BRA"},
        {"NATION:P\nL", "BRA"}, {"a,NATION:PHL,NATION:ARG", "PHL"},
        {"NATION:phl", "phl"},
    };
    for (const auto &[feature, nation] : rows) {
        gFeature = feature;
        info_.supportNation[0] = '\0';
        NOTE(VarnekCfg_IsSupportBML)();
        EXPECT_STREQ(VarnekCfg_GetSupportNation(), nation);
    }
    EXPECT_EQ(Reloaded("CONFIG_SUPPORT_NATION=ARG"), File("", 0, 0, 0, 0, "ARG"));
}

TEST_F(ConfigAlone, ASaveThatFailsIsTraced) {
    const auto save = [this](const std::string &where) {
        VarnekCfg_SaveConfigFile();
        Note("saving " + where, "");
    };
    std::filesystem::create_symlink("/dev/full", kSettingsFile);
    save("to a full device");
    EXPECT_TRUE(std::filesystem::remove(kSettingsFile));
    std::filesystem::create_directory(kSettingsFile);
    save("to a directory");
    EXPECT_TRUE(std::filesystem::remove(kSettingsFile));
    WriteAll(kSettingsFile, "protected");
    chmod(kSettingsFile, 0444);
    VarnekCfg_SaveConfigFile();
    EXPECT_EQ(TakeErrors().size(), 1u);
    EXPECT_EQ(ReadAll(kSettingsFile), "protected");
    std::filesystem::remove(kSettingsFile);
    const std::string data = std::filesystem::path(VARNEK_DATA_DIR).parent_path();
    std::filesystem::rename(data, Path("aside"));
    save("without the data directory");
    EXPECT_FALSE(std::filesystem::exists(data));
    std::filesystem::rename(Path("aside"), data);
}

TEST_F(ConfigAlone, AMediumThatIsFullLeavesTheOldText) {
    const auto saveLimited = [](rlim_t size) {
        const FileSizeLimit limit(size);
        VarnekCfg_SaveConfigFile();
    };
    for (const bool inPlace : {false, true}) {
        for (const size_t oldLength : {1u, 20u, 99u}) {
            for (rlim_t limit = 0; limit < 260; limit += 13) {
                std::filesystem::remove(kSettingsFile);
                std::filesystem::remove(Path("second name"));
                SetArea(std::string(oldLength, 'a'));
                VarnekCfg_SaveConfigFile();
                const std::string before = ReadAll(kSettingsFile);
                if (inPlace) {
                    std::filesystem::create_hard_link(kSettingsFile, Path("second name"));
                }
                SetArea(std::string(50, 'b'));
                saveLimited(limit);
                const std::string after = File(std::string(50, 'b'), 2, 0, 0, 68, "");
                EXPECT_EQ(ReadAll(kSettingsFile), limit < after.size() ? before : after) << limit;
            }
        }
    }
    // Saving for the first time leaves no file that would load as empty settings.
    std::filesystem::remove(kSettingsFile);
    saveLimited(0);
    EXPECT_FALSE(std::filesystem::exists(kSettingsFile));
}

TEST_F(ConfigAlone, SavesAtOnceThatAreKilledLeaveEitherText) {
    WriteAll(kDebugFile, "# off");
    VarnekPGL_InitializeDebug();
    const auto areaOf = [](char letter) { return std::string(static_cast<size_t>(letter - 'a' + 1) * 10, letter); };
    const auto save = [&](char letter) {
        SetArea(areaOf(letter));
        VarnekCfg_SaveConfigFile();
    };
    const auto isWhole = [&](const std::string &text) {
        return text == File(areaOf(text[strlen("CONFIG_CURRENTAREANAME=")]), 2, 0, 0, 68, "");
    };
    const auto fork2 = [](const auto &work) {
        std::array<pid_t, 2> children;
        for (int i = 0; i < 2; ++i) {
            children[size_t(i)] = fork();  // of this process's only thread
            if (children[size_t(i)] == 0) {
                work(i);
                _exit(0);
            }
        }
        return children;
    };
    save('a');
    for (int round = 0; round < 100 && !HasFailure(); ++round) {
        const auto children = fork2([&save](int) {
            for (;;) {
                save('a');
                save('i');
            }
        });
        for (int left = round % 20; left > 0; --left) {
            EXPECT_TRUE(isWhole(ReadAll(kSettingsFile)));
        }
        for (const pid_t child : children) {
            kill(child, SIGKILL);
            waitpid(child, nullptr, 0);
        }
        EXPECT_TRUE(isWhole(ReadAll(kSettingsFile)));
    }
    // Drafts are removed, even one that an earlier process with this id left behind.
    WriteAll(VARNEK_DATA_DIR "Varnek_Config.new." + std::to_string(getpid()) + ".57", "left");
    save('a');
    for (const auto &entry : std::filesystem::directory_iterator(VARNEK_DATA_DIR)) {
        EXPECT_EQ(entry.path().filename().string().rfind("Varnek_Config.new", 0), std::string::npos);
    }
    // Savers that write in place check each other's text.
    std::filesystem::create_hard_link(kSettingsFile, Path("second name"));
    for (int round = 0; round < 50; ++round) {
        const auto children = fork2([&save](int index) {
            for (int i = 0; i < 20; ++i) {
                save(static_cast<char>('a' + (i + index) % 9));
            }
        });
        for (const pid_t child : children) {
            waitpid(child, nullptr, 0);
        }
        ASSERT_TRUE(isWhole(ReadAll(kSettingsFile))) << ReadAll(kSettingsFile);
    }
}

}  // namespace
