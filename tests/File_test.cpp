#include "Varnek_File.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <optional>

#include "support/VarnekTest.h"

namespace {

namespace fs = std::filesystem;

using ::testing::ElementsAre, ::testing::IsEmpty;

constexpr int32_t kCreate = PGL_FILE_MODE_CREATE_RW, kRead = PGL_FILE_MODE_READ, kWrite = PGL_FILE_MODE_WRITE,
                  kAppend = PGL_FILE_MODE_APPEND;

class File : public VarnekTest {
  protected:
    File() {
        resultNames_ = {NAMED(VARNEK_FILE_INVALID_BASE), NAMED(VARNEK_FILE_NOT_OPENED), NAMED(VARNEK_FILE_TOO_LARGE),
                        NAMED(VARNEK_FILE_MEDIUM_FULL)};
    }
};
class LargeFile : public File {};
class Directory : public VarnekTest {};
class Command : public VarnekTest {};

TEST_F(File, FlagsResolveInTheirOrder) {
    const struct {
        int32_t flags;
        const char *content;  // of a file with "old" to which "new" was written
    } rows[] = {
        {0, nullptr},
        {16, nullptr},
        {kRead, "old"},
        {kRead | kWrite, "new"},
        {kCreate, "new"},
        {kCreate | kRead | kWrite, "new"},
        {kRead | kAppend, "oldnew"},
        {kCreate | kRead | kWrite | kAppend, "oldnew"},
    };
    const std::string path = Path("file");
    for (const auto &[flags, content] : rows) {
        WriteAll(path, "old");
        const PglFileHandle file = VarnekPGL_OpenFile(path.c_str(), flags);
        EXPECT_EQ(file != -1, content != nullptr) << flags;
        VarnekPGL_WriteFileByHandle(file, "new", 3);
        VarnekPGL_CloseFile(file);
        EXPECT_EQ(ReadAll(path), content != nullptr ? content : "old") << flags;
    }
}

TEST_F(File, PathsOf256CharactersAreRefused) {
    std::string path = fs::absolute(Path("")).string();
    const std::string folder = path + std::string(100, 'd');
    fs::create_directory(folder);
    path = folder + "/";
    path += std::string(255 - path.size(), 'f');
    EXPECT_EQ(VarnekPGL_WriteFile(path.c_str(), "x", 1), 1);
    EXPECT_THAT(TakeLog(), IsEmpty());
    path += "f";
    EXPECT_EQ(VarnekPGL_OpenFile(path.c_str(), PGL_FILE_MODE_READ), -1);
    EXPECT_THAT(TakeErrors(), ElementsAre("VarnekPGL_OpenFile : file path(" + path + ") length over max size"));
}

TEST_F(File, FailuresHaveTheirLineAndResult) {
    const std::string none = Path("none");
    const PglFileHandle writer = VarnekPGL_OpenFile(Path("w").c_str(), PGL_FILE_MODE_WRITE);
    char buffer[8] = {};
    char hexadecimal[16];
    snprintf(hexadecimal, sizeof hexadecimal, "0x%x", static_cast<unsigned>(writer));
    Show(hexadecimal, "WRITER");
    Show("(" + std::to_string(writer) + ", ", "(WRITER, ");
    NOTE(VarnekPGL_OpenFile)(nullptr, kRead);
    NOTE(VarnekPGL_CloseFile)(0);
    EXPECT_EQ(VarnekPGL_CloseFile(-1), -1);
    NOTE(VarnekPGL_SeekFile)(0, 0, SEEK_SET);
    NOTE(VarnekPGL_SeekFile)(writer, 0, 3);
    NOTE(VarnekPGL_SeekFile)(writer, -1, SEEK_SET);
    NOTE(VarnekPGL_TellFile)(0);
    NOTE(VarnekPGL_FlushFile)(0);
    NOTE(VarnekPGL_ReadFileByHandle)(0, buffer, 1);
    NOTE(VarnekPGL_WriteFileByHandle)(0, buffer, 1);
    NOTE(VarnekPGL_WriteFileByHandle)(writer, nullptr, 1);
    NOTE(VarnekPGL_ReadFileByHandle)(writer, nullptr, 1);
    EXPECT_EQ(VarnekPGL_ReadFileByHandle(writer, buffer, 8), 0u);
    EXPECT_EQ(VarnekPGL_GetFileSizeByHandle(0), -1);
    EXPECT_EQ(VarnekPGL_CheckFile(none.c_str()), FALSE);
    NOTE(VarnekPGL_DeleteFile)(none);
    NOTE(VarnekPGL_WriteFile)(Path("w"), nullptr, 1);
    NOTE(VarnekPGL_AppendFile)(Path("w"), nullptr, 1);
    // Data for a full disk is not reported as stored. Fault_test.cpp shows the other failures of the system's calls.
    NOTE(VarnekPGL_WriteFile)("/dev/full", "abc", 3);
    EXPECT_EQ(VarnekPGL_AppendFile("/dev/full", std::vector<char>(100000).data(), 100000), -1);
    VarnekPGL_CloseFile(writer);
}

TEST_F(File, SizesAndPositions) {
    const std::string path = Path("file");
    EXPECT_EQ(VarnekPGL_AppendFile(path.c_str(), "", 0), 0);
    EXPECT_EQ(VarnekPGL_GetFileSize(path.c_str()), 0);
    EXPECT_EQ(VarnekPGL_AppendFile(path.c_str(), "0123456789", 10), 0);
    EXPECT_EQ(VarnekPGL_GetFileSize(path.c_str()), 10);
    const PglFileHandle file = VarnekPGL_OpenFile(path.c_str(), PGL_FILE_MODE_READ);
    for (int32_t position : {0, 4, 10}) {
        EXPECT_EQ(VarnekPGL_SeekFile(file, position, SEEK_SET), 0);
        EXPECT_EQ(VarnekPGL_GetFileSizeByHandle(file), 10);
        EXPECT_EQ(VarnekPGL_TellFile(file), position);
    }
    char buffer[16];
    EXPECT_EQ(VarnekPGL_SeekFile(file, -3, SEEK_END), 0);
    EXPECT_EQ(VarnekPGL_ReadFileByHandle(file, buffer, 16), 3u);
    EXPECT_EQ(VarnekPGL_AppendFile(path.c_str(), "more", 4), 0);
    EXPECT_EQ(VarnekPGL_GetFileSizeByHandle(file), 14);
    EXPECT_EQ(VarnekPGL_ReadFileByHandle(file, buffer, 16), 4u) << "a reader cannot follow a file that grows";
    VarnekPGL_CloseFile(file);
    EXPECT_EQ(VarnekPGL_ReadFile(path.c_str(), buffer, 5), 5);
    EXPECT_THAT(TakeLog(), IsEmpty());
    // Some systems refuse to seek in a directory, which makes two lines.
    EXPECT_EQ(VarnekPGL_GetFileSize(Path("").c_str()), 0) << "a directory has a size";

    const std::string large = Path("large");
    WriteAll(large, "");
    truncate64(large.c_str(), INT32_MAX);
    EXPECT_EQ(VarnekPGL_GetFileSize(large.c_str()), INT32_MAX);
    truncate64(large.c_str(), 5LL << 30);
    EXPECT_EQ(VarnekPGL_GetFileSize(large.c_str()), 0);
    const PglFileHandle beyond = VarnekPGL_OpenFile(large.c_str(), PGL_FILE_MODE_READ);
    if (beyond != -1 && sizeof(long) == 8) {  // 32 bits have no such position
        VarnekPGL_SeekFile(beyond, INT32_MAX, SEEK_SET);
        VarnekPGL_SeekFile(beyond, INT32_MAX, SEEK_CUR);
        EXPECT_EQ(VarnekPGL_GetFileSizeByHandle(beyond), -1);
        EXPECT_EQ(int64_t{ftell(reinterpret_cast<FILE *>(beyond))}, 2LL * INT32_MAX);
        VarnekPGL_CloseFile(beyond);
    }
}

TEST_F(File, LogLinesOfThreadsAreCutAndNeverMix) {
    AtOnce(4, [](int thread) {
        const std::string path(2000, static_cast<char>('a' + thread));
        for (int i = 0; i < 200; i++) {
            VarnekPGL_OpenFile(path.c_str(), PGL_FILE_MODE_READ);
        }
    });
    const std::string head = "VarnekPGL_OpenFile : file path(";
    for (const LogLine &line : TakeLog()) {
        ASSERT_EQ(line.tag, "SBTVD_File");
        ASSERT_EQ(line.text, head + std::string(1023 - head.size(), line.text.back()));
    }
}

TEST_F(LargeFile, FlagsGiveTheirAccess) {
    const std::string path = Path("file");
    const std::pair<int32_t, int> rows[] = {
        {0, O_RDONLY},
        {kRead, O_RDONLY},
        {kWrite, O_WRONLY},
        {kRead | kWrite, O_RDWR},
        {kAppend, O_RDONLY | O_APPEND},
        {kRead | kAppend, O_RDONLY | O_APPEND},
        {kWrite | kAppend, O_WRONLY | O_APPEND},
        {kRead | kWrite | kAppend, O_RDWR},
    };
    for (const auto &[flags, access] : rows) {
        for (const int create : {0, kCreate}) {
            const std::string label = std::to_string(flags | create);
            WriteAll(path, "kept");
            int32_t fd = VarnekPGL_OpenFile64Bits(path.c_str(), flags | create);
            struct stat status = {};
            EXPECT_EQ(fcntl(fd, F_GETFL) & (O_ACCMODE | O_APPEND), create != 0 ? O_RDWR | (access & O_APPEND) : access)
                << label;
            EXPECT_TRUE(fstat(fd, &status) == 0 && status.st_size == 4) << label;
            VarnekPGL_CloseFile64Bits(fd);
            fs::remove(path);
            EXPECT_THAT(TakeLog(), IsEmpty());
            fd = VarnekPGL_OpenFile64Bits(path.c_str(), flags | create);
            EXPECT_EQ(fd == -1, create == 0) << label;
            EXPECT_TRUE(fd == -1 || (fstat(fd, &status) == 0 && (status.st_mode & 0777u) == 0644)) << label;
            VarnekPGL_CloseFile64Bits(fd);
            TakeLog();
        }
    }
}

TEST_F(LargeFile, BeyondFourGiB) {
    const std::string path = Path("sparse");
    const int64_t end = (int64_t{5} << 30) + 7;
    // A process without a standard input gets 0 as its first handle.
    const int input = dup(STDIN_FILENO);
    close(STDIN_FILENO);
    const int32_t fd = VarnekPGL_OpenFile64Bits(path.c_str(), PGL_FILE_MODE_CREATE_RW);
    EXPECT_EQ(fd, 0);
    EXPECT_EQ(VarnekPGL_SeekFile64Bits(fd, end - 3, SEEK_SET), 0);
    EXPECT_EQ(VarnekPGL_WriteFileByHandle64Bits(fd, "end", 3), 3);
    EXPECT_EQ(VarnekPGL_SeekFile64Bits(fd, -3, SEEK_CUR), 0);
    char buffer[8] = {};
    EXPECT_EQ(VarnekPGL_ReadFileByHandle64Bits(fd, buffer, 8), 3);
    EXPECT_STREQ(buffer, "end");
    EXPECT_EQ(VarnekPGL_SeekFile64Bits(fd, 5, SEEK_SET), 0);
    EXPECT_EQ(VarnekPGL_GetFileSizeByHandle64Bits(fd), end);
    EXPECT_EQ(VarnekPGL_TellFile64Bits(fd), 5);
    EXPECT_EQ(VarnekPGL_FlushFile64Bits(fd), 0);
    EXPECT_EQ(VarnekPGL_CloseFile64Bits(fd), 0);
    dup2(input, STDIN_FILENO);
    close(input);
    EXPECT_EQ(VarnekPGL_GetFileSize64Bits(path.c_str()), end);
    EXPECT_EQ(VarnekPGL_GetFileSize64Bits(Path("none").c_str()), 0);
    EXPECT_THAT(TakeLog(), IsEmpty());
}

TEST_F(File, ASizeQueryOnAFullMediumKeepsThePosition) {
    const PglFileHandle file = VarnekPGL_OpenFile(Path("full").c_str(), PGL_FILE_MODE_CREATE_RW);
    const FileSizeLimit limit(10);
    const std::string data(100, 'x');
    EXPECT_EQ(VarnekPGL_WriteFileByHandle(file, data.data(), 100), 100u);
    EXPECT_EQ(VarnekPGL_GetFileSizeByHandle(file), 10);
    EXPECT_EQ(VarnekPGL_TellFile(file), 100);
    EXPECT_THAT(TakeLog(), Not(IsEmpty()));
    VarnekPGL_CloseFile(file);
}

TEST_F(LargeFile, FailuresHaveTheirLineAndResult) {
    const std::string path = Path("limited");
    const int32_t full = VarnekPGL_OpenFile64Bits("/dev/full", PGL_FILE_MODE_WRITE);
    const int32_t limited = VarnekPGL_OpenFile64Bits(path.c_str(), PGL_FILE_MODE_CREATE_RW);
    const int32_t reader = VarnekPGL_OpenFile64Bits(path.c_str(), PGL_FILE_MODE_READ);
    std::optional<FileSizeLimit> limit(100);
    const std::string data(150, 'x');
    Show(strerror(0), "no error");
    for (const auto &[fd, name] : {NAMED(full), NAMED(limited), NAMED(reader)}) {
        Show("Hndl : " + std::to_string(fd), std::string("Hndl : ") + name);
        Show("(" + std::to_string(fd) + ", ", "(" + std::string(name) + ", ");
    }
    NOTE(VarnekPGL_WriteFileByHandle64Bits)(full, "x", 1);
    NOTE(VarnekPGL_WriteFileByHandle64Bits)(limited, data, 150);
    NOTE(VarnekPGL_WriteFileByHandle64Bits)(limited, data, 150);
    NOTE(VarnekPGL_WriteFileByHandle64Bits)(reader, "x", 1);
    NOTE(VarnekPGL_WriteFileByHandle64Bits)(-2, "x", 1);
    NOTE(VarnekPGL_ReadFileByHandle64Bits)(-1, nullptr, 1);
    NOTE(VarnekPGL_SeekFile64Bits)(-1, 0, 5);
    NOTE(VarnekPGL_SeekFile64Bits)(-1, 0, SEEK_END);
    NOTE(VarnekPGL_TellFile64Bits)(-1);
    NOTE(VarnekPGL_FlushFile64Bits)(-1);
    NOTE(VarnekPGL_CloseFile64Bits)(-1);
    limit.reset();
    EXPECT_EQ(VarnekPGL_ReadFileByHandle64Bits(full + 500, nullptr, 1), -1);
    EXPECT_EQ(VarnekPGL_GetFileSizeByHandle64Bits(-1), -1);
    EXPECT_THAT(TakeLog(), IsEmpty());
    for (int32_t fd : {full, limited, reader}) {
        VarnekPGL_CloseFile64Bits(fd);
    }
}

TEST_F(Directory, FailuresHaveTheirLineAndResult) {
    const std::string none = Path("none");
    const std::string tooLong(256, 'd');
    PglFmFileAttributes attributes;
    PglDirEntryInfo info = {7, ""};
    Show("pid(" + std::to_string(getpid()) + ") uid(" + std::to_string(getuid()), "pid(PID) uid(UID");
    NOTE(VarnekPGL_MakeDir)(Path(""));
    NOTE(VarnekPGL_MakeDir)(tooLong);
    NOTE(VarnekPGL_DeleteDirEx)(none + "/");
    NOTE(VarnekPGL_DeleteDirEx)(nullptr);
    EXPECT_EQ(VarnekPGL_ClearDir(tooLong.c_str()), -1);
    NOTE(VarnekPGL_CheckDir)(none);
    NOTE(__VarnekPGL_ReadDir)(nullptr, nullptr);
    NOTE(VarnekPGL_ReadDir)(nullptr, nullptr);
    EXPECT_FALSE(VarnekPGL_ReadDir(PGL_INVALID_DIR_HANDLE, &info));
    EXPECT_FALSE(VarnekPGL_FmGetFileAttributes(none.c_str(), nullptr));
    NOTE(VarnekPGL_FmGetFileAttributes)(none, &attributes);
    EXPECT_EQ(VarnekPGL_DeleteDirEx(""), -1);
    EXPECT_TRUE(VarnekPGL_CloseDir(PGL_INVALID_DIR_HANDLE));
    EXPECT_EQ(info.type, 0u);
    EXPECT_FALSE(fs::exists(none));
}

// Returns what a directory's listing shows.
std::map<std::string, uint32_t> ListingOf(const std::string &path) {
    std::map<std::string, uint32_t> types;
    void *const directory = VarnekPGL_OpenDir(path.c_str());
    PglDirEntryInfo info;
    while (VarnekPGL_ReadDir(directory, &info)) {
        types[info.name] = info.type;
    }
    EXPECT_EQ(info.type, 0u);
    EXPECT_EQ(VarnekPGL_CloseDir(directory), TRUE);
    return types;
}

TEST_F(Directory, AListingGivesTypesAndEndsAtANameOfMoreThan236Bytes) {
    fs::create_directory(Path("sub"));
    WriteAll(Path("file"), "12345");
    fs::create_symlink("sub", Path("link"));
    EXPECT_EQ(ListingOf(Path("")), (std::map<std::string, uint32_t>{{".", PGL_ENTRY_DIR},
                                                                    {"..", PGL_ENTRY_DIR},
                                                                    {"file", PGL_ENTRY_FILE},
                                                                    {"link", PGL_ENTRY_FILE},
                                                                    {"sub", PGL_ENTRY_DIR}}));
    EXPECT_THAT(TakeErrors(), ElementsAre(::testing::StartsWith("__VarnekPGL_ReadDir : return FALSE pDir = 0x")));
    for (const size_t length : {236u, 237u}) {
        const std::string name(length, 'n');
        WriteAll(Path("sub/" + name), "");
        EXPECT_EQ(ListingOf(Path("sub")).count(name), length == 236 ? 1u : 0u);
        fs::remove(Path("sub/" + name));
    }
    PglFmFileAttributes attributes, expected = {};
    memset(&attributes, 0xFF, sizeof attributes);
    expected.size = 5;
    EXPECT_TRUE(VarnekPGL_FmGetFileAttributes(Path("file").c_str(), &attributes));
    EXPECT_EQ(memcmp(&attributes, &expected, sizeof expected), 0);
}

TEST_F(Directory, TreesAreDeletedWholeAndNothingElse) {
    const std::string outside = Path("outside");
    fs::create_directory(outside);
    WriteAll(outside + "/kept", "kept");
    for (const char *suffix : {"", "/", "\\", "//"}) {
        const std::string tree = Path("tree");
        std::string level = tree;
        for (int depth = 0; depth < 60 && level.size() < 240; depth++) {
            fs::create_directory(level);
            WriteAll(level + "/f", "");
            level += "/d";
        }
        fs::create_directory_symlink("../outside", tree + "/link");
        fs::create_symlink("nowhere", tree + "/dangling");
        EXPECT_EQ(VarnekPGL_DeleteDir((tree + suffix).c_str()), 0) << suffix;
        EXPECT_FALSE(fs::exists(tree));
        EXPECT_EQ(ReadAll(outside + "/kept"), "kept");
    }
    for (const char *suffix : {"", "/", "//", "/.", "/.//"}) {
        fs::create_directory_symlink("outside", Path("root"));
        EXPECT_EQ(VarnekPGL_DeleteDirEx((Path("root") + suffix).c_str()), 0) << suffix;
        EXPECT_FALSE(fs::exists(fs::symlink_status(Path("root"))));
        EXPECT_EQ(ReadAll(outside + "/kept"), "kept");
    }
    EXPECT_EQ(VarnekPGL_ClearDir(outside.c_str()), 0);
    EXPECT_TRUE(fs::is_empty(outside));
}

TEST_F(Directory, ADirectoryThatIsSwappedForALinkIsNotEntered) {
    const std::string outside = Path("outside"), inner = Path("tree/inner");
    fs::create_directory(outside);
    WriteAll(outside + "/kept", "kept");
    for (int i = 0; i < 1000; i++) {
        fs::create_directories(inner);
        fs::create_directory_symlink(outside, Path("link"));
        std::thread swapper([&] {
            rename(inner.c_str(), Path("aside").c_str());
            rename(Path("link").c_str(), inner.c_str());
        });
        VarnekPGL_DeleteDirEx(Path("tree").c_str());
        swapper.join();
        ASSERT_EQ(ReadAll(outside + "/kept"), "kept");
        for (const char *left : {"tree", "aside", "link"}) {
            fs::remove_all(Path(left));
        }
    }
}

TEST_F(Directory, AFileThatCannotBeDeletedStaysAndIsReported) {
    const std::string tree = Path("tree");
    fs::create_directory(tree);
    WriteAll(tree + "/gone", "");
    std::string deep = tree;
    while (deep.size() + 60 < 256) {
        deep += "/" + std::string(50, 'd');
        fs::create_directory(deep);
    }
    const std::string kept = deep + "/" + std::string(100, 'k');
    WriteAll(kept, "kept");
    EXPECT_EQ(VarnekPGL_DeleteDirEx(tree.c_str()), -1);
    EXPECT_EQ(ReadAll(kept), "kept");
    EXPECT_FALSE(fs::exists(tree + "/gone"));
    EXPECT_THAT(TakeErrors(),
                ::testing::IsSupersetOf({"VarnekPGL_DeleteDirEx : exceed max file path length : " + kept,
                                         "VarnekPGL_DeleteDirEx : rmdir[" + tree + "] Fail. return FALSE"}));
}

TEST_F(Command, AnyPathIsOneWord) {
    const fs::path home = fs::current_path();
    fs::current_path(Path(""));
    for (const char *name :
         {"plain", "two words", "it's", "\"quoted\"", "semi;touch hurt", "`touch hurt`", "$(touch hurt)", "$HOME",
          "new\nline", "-rf", "- x", "*", "~", "a\\b", "&", "#c", "\xC3\xA9t\xC3\xA9", "'; touch hurt; '"}) {
        WriteAll(name, "content");
        EXPECT_EQ(VarnekPGL_CopyFile(name, "copy"), 0) << name;
        EXPECT_EQ(ReadAll("copy"), "content") << name;
        EXPECT_EQ(VarnekPGL_MoveFile(name, "moved"), 0) << name;
        EXPECT_EQ(VarnekPGL_CopyFile("moved", name), 0) << name;
        EXPECT_EQ(ReadAll(name), "content") << name;
        EXPECT_EQ(VarnekPGL_Chmod(name, 755), 0) << name;
        EXPECT_EQ(access(name, X_OK), 0) << name;
        EXPECT_EQ(VarnekPGL_DeleteFile(name), 0) << name;
    }
    EXPECT_FALSE(fs::exists("hurt"));
    fs::create_directory("empty");
    EXPECT_EQ(VarnekPGL_DeleteFile("empty"), 0) << "as remove does";
    EXPECT_THAT(TakeErrors(), IsEmpty());
    fs::current_path(home);
}

TEST_F(Command, RefusalsKeepTheDestination) {
    const std::string destination = Path("destination");
    WriteAll(destination, "kept");
    fs::create_hard_link(destination, Path("same"));
    const std::string longPath(520, 'x');
    for (const std::string &source : {Path("none"), Path(""), Path("same"), destination, longPath, std::string()}) {
        EXPECT_EQ(VarnekPGL_CopyFile(source.c_str(), destination.c_str()), -1) << source;
        EXPECT_EQ(TakeErrors().size(), 1u) << source;
    }
    NOTE(VarnekPGL_CopyFile)(destination, longPath);
    EXPECT_EQ(VarnekPGL_MoveFile(destination.c_str(), longPath.c_str()), -1);
    NOTE(VarnekPGL_MoveFile)(nullptr, destination);
    EXPECT_EQ(ReadAll(destination), "kept");
}

TEST_F(Command, ChmodTakesThreeModesAndReturnsTheStatus) {
    const std::string path = Path("file");
    WriteAll(path, "");
    for (const auto &[mode, permissions] : {std::pair(666, 0666), {755, 0755}, {777, 0777}}) {
        EXPECT_EQ(VarnekPGL_Chmod(path.c_str(), mode), 0);
        EXPECT_EQ(fs::status(path).permissions(), static_cast<fs::perms>(permissions));
    }
    NOTE(VarnekPGL_Chmod)(path, 644);
    NOTE(VarnekPGL_Chmod)(Path("none"), 666);  // exit status 1, as system() returns it
    NOTE(VarnekPGL_Chmod)(std::string(505, 'x'), 666);
}

}  // namespace
