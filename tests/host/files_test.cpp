// The host's file writer, file identity and lock: what a replaced file keeps, what a
// failed write leaves and says, and the lock between two processes.
#include "velhost/files.h"

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <fstream>
#include <random>
#include <string_view>

#include "file_faults.hpp"
#include "support/temp_dir.hpp"

namespace fs = std::filesystem;

namespace {

mode_t ModeOf(const std::string& path)
{
    struct stat st {};
    stat(path.c_str(), &st);
    return st.st_mode & 07777;
}

std::size_t EntriesIn(const fs::path& folder)
{
    std::size_t n = 0;
    for ([[maybe_unused]] const auto& entry : fs::directory_iterator(folder))
        ++n;
    return n;
}

TEST(VelFileWriter, ReplacedFileKeepsModeLinkAndBackup)
{
    TempDir dir;
    const mode_t savedMask = umask(027);
    struct Case {
        const char* name;
        const char* existing; // null: no file before
        mode_t mode;
        bool backup;
        mode_t expectedMode;
        bool expectBackup;
    } cases[] = {
        {"new file honours the umask", nullptr, 0, true, 0640, false},
        {"existing file keeps its mode", "v1", 0604, false, 0604, false},
        {"backup of the previous version", "v1", 0600, true, 0600, true},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const std::string path = dir.File(std::string(c.name) + ".txt");
        if (c.existing) {
            dir.Write(std::string(c.name) + ".txt", c.existing);
            chmod(path.c_str(), c.mode);
        }
        VelWriteOptions options;
        options.keepBackup = c.backup;
        const VelReadResult result = velWriteFileAtomically(path, "v2", options);
        ASSERT_TRUE(result) << result.message;
        EXPECT_EQ(result.message, "");
        EXPECT_EQ(dir.Read(std::string(c.name) + ".txt"), "v2");
        EXPECT_EQ(ModeOf(path), c.expectedMode);
        EXPECT_EQ(fs::exists(path + ".bak"), c.expectBackup);
        if (c.expectBackup) {
            EXPECT_EQ(dir.Read(std::string(c.name) + ".txt.bak"), "v1");
        }
    }
    umask(savedMask);

    // A link is followed: the file it names gets the content, the link stays a link.
    dir.Write("vrai.ini", "ancien");
    fs::create_symlink("vrai.ini", dir.path / "lien.ini");
    ASSERT_TRUE(velWriteFileAtomically(dir.File("lien.ini"), "nouveau"));
    EXPECT_TRUE(fs::is_symlink(dir.path / "lien.ini"));
    EXPECT_EQ(dir.Read("vrai.ini"), "nouveau");
}

TEST(VelFileWriter, FailuresSayWhyAndLeaveNothing)
{
    TempDir dir;
    dir.Write("dossier/x", "");
    struct Case {
        const char* name;
        std::string path;
        const char* expected;
    } cases[] = {
        {"missing folder", dir.File("absent/plan.dxf"),
         "non enregistré : dossier introuvable (pendant la création du fichier temporaire). Aucun fichier n'a été "
         "créé ; vérifiez le chemin du fichier."},
        {"a folder in the way", dir.File("dossier"), "non enregistré : un dossier porte ce nom."},
    };
    // Permissions do not hold back the superuser.
    const std::string locked = dir.Write("protege.ini", "a=1");
    chmod(locked.c_str(), 0444);
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        const VelReadResult result = velWriteFileAtomically(c.path, "x");
        EXPECT_FALSE(result);
        EXPECT_EQ(result.message.rfind("Fichier « " + c.path + " »", 0), 0u) << result.message;
        EXPECT_NE(result.message.find(c.expected), std::string::npos) << result.message;
    }
    if (geteuid() != 0) {
        const VelReadResult result = velWriteFileAtomically(locked, "a=2");
        EXPECT_NE(result.message.find("permission refusée (le fichier est protégé en écriture)"), std::string::npos)
            << result.message;
        EXPECT_EQ(dir.Read("protege.ini"), "a=1");
    }
    EXPECT_EQ(EntriesIn(dir.path), 2u);
    EXPECT_EQ(EntriesIn(dir.path / "dossier"), 1u);
}

TEST(VelFileWriter, EveryFailingCallLeavesThePreviousVersion)
{
    TempDir dir;
    const std::string path = dir.File("prix.xml");
    VelWriteOptions options;
    options.keepBackup = true;
    VelReadResult result;
    const int calls = ForEveryFailingCall(
        [&] {
            fs::remove_all(dir.path);
            dir.Write("prix.xml", "version 2");
            dir.Write("prix.xml.bak", "version 1");
        },
        [&] { result = velWriteFileAtomically(path, "version 3", options); },
        [&](const FaultRun& run) {
            SCOPED_TRACE(run.failed + " n° " + std::to_string(run.calls));
            if (run.committed) {
                // Only the backup's rename and the folder's flush come after the new
                // version's rename: it stands, with a warning.
                EXPECT_TRUE(result);
                EXPECT_EQ(dir.Read("prix.xml"), "version 3");
                EXPECT_NE(result.message.find("Fichier « " + path + " » enregistré, mais "), std::string::npos)
                    << result.message;
            } else {
                EXPECT_FALSE(result);
                EXPECT_EQ(dir.Read("prix.xml"), "version 2");
                EXPECT_NE(result.message.find("Fichier « " + path + " » non enregistré : " +
                                              velFileErrorReason(FileFaults::ErrorOf(run.failed))),
                          std::string::npos)
                    << result.message;
                EXPECT_NE(result.message.find("Le fichier précédent est conservé tel quel"), std::string::npos);
                EXPECT_EQ(dir.Read("prix.xml.bak"), "version 1");
            }
            EXPECT_EQ(EntriesIn(dir.path), 2u) << "no temporary file left";
        });
    EXPECT_GE(calls, 8) << "open, write, fsync, close, link, rename, rename, folder open, fsync, close";
}

TEST(VelFileWriter, LibraryWritesTheTemporaryFileByName)
{
    TempDir dir;
    const std::string path = dir.File("devis.xlsx");
    {
        VelAtomicFile file(path);
        ASSERT_TRUE(file.open());
        std::ofstream(file.temporaryPath(), std::ios::binary | std::ios::trunc) << "classeur";
        ASSERT_TRUE(file.commit());
    }
    EXPECT_EQ(dir.Read("devis.xlsx"), "classeur");
    {
        VelAtomicFile file(path);
        ASSERT_TRUE(file.open());
        std::ofstream(file.temporaryPath(), std::ios::binary) << "abandonné";
    }
    EXPECT_EQ(dir.Read("devis.xlsx"), "classeur");
    EXPECT_EQ(EntriesIn(dir.path), 1u) << "an uncommitted temporary file is removed";
}

TEST(VelFileIdentity, ContentTellsVersionsApart)
{
    TempDir dir;
    const std::string path = dir.Write("a.xml", "prix=12.50");
    const VelFileIdentity first = velFileIdentity(path);
    EXPECT_TRUE(first.exists);
    EXPECT_EQ(first.size, 10u);
    struct Case {
        const char* name;
        std::string content;
        bool same;
    } cases[] = {
        {"rewritten alike", "prix=12.50", true},
        {"same size, one digit", "prix=12.51", false},
        {"two bytes swapped", "prix=21.50", false},
        {"empty", "", false},
        {"a NUL more", std::string("prix=12.50", 11), false},
    };
    for (const Case& c : cases) {
        SCOPED_TRACE(c.name);
        dir.Write("a.xml", c.content);
        EXPECT_EQ(first.sameContent(velFileIdentity(path)), c.same);
    }
    const VelFileIdentity missing = velFileIdentity(dir.File("absent.xml"));
    EXPECT_FALSE(missing.exists);
    EXPECT_TRUE(missing.sameContent(velFileIdentity(dir.File("autre.xml"))));
    EXPECT_FALSE(missing.sameContent(velFileIdentity(dir.Write("vide.xml", ""))));
}

// The file read whole carries the identity of its bytes, the same as velFileIdentity
// gives, whatever pieces either reads and hashes; and it is known to whoever asks after.
TEST(VelReadFile, BytesAndTheirIdentityAsVelFileIdentityHasThem)
{
    TempDir dir;
    std::mt19937 random(7);
    // About the hash's stripes of 32 bytes and the pieces of both readers.
    for (const std::size_t size : {0, 1, 31, 32, 33, 65535, 65536, 65569, (1 << 20) + 7, (3 << 20) + 100}) {
        SCOPED_TRACE(size);
        std::string content(size, '\0');
        for (char& c : content)
            c = static_cast<char>(random());
        const std::string path = dir.Write("f.bin", content);
        const std::uint64_t mark = velFileReadMark();
        const VelFileContent read = velReadFile(path);
        ASSERT_TRUE(read.opened);
        EXPECT_TRUE(read.identity.readable);
        ASSERT_EQ(read.size, size);
        EXPECT_TRUE(std::string_view(read.data.get(), read.size) == content);
        EXPECT_EQ(read.data[size], '\0');
        const VelFileIdentity identity = velFileIdentity(path);
        EXPECT_EQ(read.identity.hash, identity.hash);
        EXPECT_TRUE(read.identity.sameContent(identity));
        VelFileIdentity seen;
        ASSERT_TRUE(velFileReadSince(mark, path, seen));
        EXPECT_EQ(seen.hash, identity.hash);
        EXPECT_FALSE(velFileReadSince(mark, dir.File("autre.bin"), seen)) << "another file";
        EXPECT_FALSE(velFileReadSince(velFileReadMark(), path, seen)) << "nothing read since";
    }
    const VelFileContent folder = velReadFile(dir.path.string());
    EXPECT_TRUE(folder.identity.exists);
    EXPECT_FALSE(folder.identity.readable);
    const VelFileContent missing = velReadFile(dir.File("absent.bin"));
    EXPECT_FALSE(missing.opened);
    EXPECT_FALSE(missing.identity.exists);
    EXPECT_EQ(missing.error, ENOENT);
}

TEST(VelFileLock, SharedInProcessExclusiveBetweenProcesses)
{
    TempDir dir;
    const std::string path = dir.File("VelaBordereau.xml");
    {
        const VelFileLock outer(path);
        ASSERT_TRUE(outer.locked()) << outer.result().message;
        const VelFileLock inner(path, 0);
        EXPECT_TRUE(inner.locked()) << "a second lock of this process does not wait for the first";
    }
    int toChild[2], toParent[2];
    ASSERT_EQ(pipe(toChild), 0);
    ASSERT_EQ(pipe(toParent), 0);
    const pid_t child = fork();
    ASSERT_GE(child, 0);
    if (child == 0) {
        const VelFileLock held(path);
        char c = held.locked() ? 'o' : 'n';
        if (write(toParent[1], &c, 1) != 1 || read(toChild[0], &c, 1) != 1)
            _exit(2);
        _exit(0);
    }
    char c = 0;
    ASSERT_EQ(read(toParent[0], &c, 1), 1);
    ASSERT_EQ(c, 'o');
    {
        const VelFileLock waiting(path, 1);
        EXPECT_FALSE(waiting.locked());
        EXPECT_NE(waiting.result().message.find("fichier verrouillé par un autre programme (depuis 1 s)"),
                  std::string::npos)
            << waiting.result().message;
    }
    ASSERT_EQ(write(toChild[1], &c, 1), 1);
    int status = 0;
    waitpid(child, &status, 0);
    EXPECT_TRUE(VelFileLock(path, 1).locked()) << "free once the other process let go";
    EXPECT_TRUE(fs::exists(VelFileLock::lockFileOf(path)));
    for (int fd : {toChild[0], toChild[1], toParent[0], toParent[1]})
        close(fd);
}

} // namespace
