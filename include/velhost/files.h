// Files written whole or not at all, the identity of a file as it was read, and the lock
// that keeps two processes from writing one file at the same time.
#pragma once

#include <sys/types.h>

#include "velhost/read_result.h"

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#pragma GCC visibility push(default)

// Outcome of a write: on failure, a French sentence naming the file, what went wrong and
// what to do, and the system's error code. A success may carry a warning.
struct VelWriteOptions {
    // The version being replaced is kept as "<path>.bak" (replacing an older one in one
    // step); nothing is kept when the file did not exist.
    bool keepBackup = false;
};

// Replaces `path` with `content`: the bytes go to a temporary file in the same folder,
// which is flushed to disk, takes the target's permissions (a new file those the umask
// allows), and is renamed over the target; the folder is then flushed too. A symbolic
// link is followed, so the file it names is replaced; a file protected from writing is
// not replaced. On failure the temporary file is removed and the target is as it was.
VelReadResult velWriteFileAtomically(const std::string& path, std::string_view content,
                                     const VelWriteOptions& options = {});

// The same in steps, for content produced piece by piece or by a library that writes to
// a file name: open(), then write() or let the library write to temporaryPath(), then
// commit(). Without a commit (a failure, an exception) the temporary file is removed.
class VelAtomicFile {
public:
    explicit VelAtomicFile(std::string path, VelWriteOptions options = {});
    ~VelAtomicFile();
    VelAtomicFile(const VelAtomicFile&) = delete;
    VelAtomicFile& operator=(const VelAtomicFile&) = delete;

    VelReadResult open();
    // The temporary file; whatever writes it must leave it in place (no rename).
    const std::string& temporaryPath() const { return temporary_; }
    VelReadResult write(std::string_view piece);
    VelReadResult commit();
    // Removes the temporary file; the target is left alone.
    void discard();
    // The file that a commit replaces (the target of a symbolic link).
    const std::string& target() const { return target_; }

private:
    VelReadResult fail(const char* step, int error);

    std::string path_;
    std::string target_;
    std::string temporary_;
    VelWriteOptions options_;
    int fd_ = -1;
    bool existed_ = false;
};

// What a file was when it was read: its size, modification time and a hash of its
// content. Two identities with the same content (existence, size and hash) stand for the
// same version, whatever their times.
struct VelFileIdentity {
    bool exists = false;
    bool readable = true; // false when the file exists but could not be read whole
    std::uint64_t size = 0;
    std::int64_t modified = 0; // nanoseconds since 1970
    std::uint64_t hash = 0;
    bool sameContent(const VelFileIdentity& other) const;
};
VelFileIdentity velFileIdentity(const std::string& path);

// Where a file is and when it last changed, as the system keeps them, without reading it:
// two equal stamps mean that nothing wrote, replaced or renamed the file in between (to
// the precision of the file system's times).
struct VelFileStamp {
    bool exists = false;
    std::uint64_t device = 0;
    std::uint64_t inode = 0;
    std::uint64_t size = 0;
    std::int64_t modified = 0; // nanoseconds since 1970
    std::int64_t changed = 0;  // status change (ctime), nanoseconds since 1970
    bool operator==(const VelFileStamp&) const = default;
};
VelFileStamp velFileStamp(const std::string& path);

// A regular file read whole in one go, with the identity of exactly the bytes read: a
// reader that keeps the identity needs no second reading, and a version written between
// two readings cannot pass for the one parsed.
struct VelFileContent {
    std::unique_ptr<char[]> data; // size bytes, then a NUL
    std::size_t size = 0;
    bool opened = false;
    // exists and readable as velFileIdentity has them; readable is false for anything but a
    // regular file and for one that ends before the size it announced.
    VelFileIdentity identity;
    int error = 0; // the system's error code of a failed open or read
};
VelFileContent velReadFile(const std::string& path);

// What another module read. velReadFile leaves, for its thread, the identity of the last
// file it read: the caller of a module that reads a file of its own format through it
// learns which version that module parsed, without reading the file a second time, which
// would cost as much again and could meet a version written in between. Take a mark
// before the call; after it, velFileReadSince answers the identity of `path` (named
// exactly as the module was given it) when the last file velReadFile read in this thread
// since the mark was that one. It answers false when the module read nothing through
// velReadFile, read another file last, or read in another thread: the caller then has to
// tell the version another way.
std::uint64_t velFileReadMark();
bool velFileReadSince(std::uint64_t mark, const std::string& path, VelFileIdentity& identity);

// An advisory lock (fcntl, on the open file) on "<folder>/.<name>.verrou", which
// outlives the replacements of the file itself; held from construction to destruction.
// Within a process the lock is shared: a second lock on the same file while the first is
// held succeeds at once and the lock goes with the last one. Waits up to `waitSeconds`
// for another process; locked() false with the reason in result() otherwise.
class VelFileLock {
public:
    explicit VelFileLock(const std::string& path, int waitSeconds = 30);
    ~VelFileLock();
    VelFileLock(const VelFileLock&) = delete;
    VelFileLock& operator=(const VelFileLock&) = delete;
    bool locked() const { return key_ != nullptr; }
    const VelReadResult& result() const { return result_; }
    // The lock file of a file.
    static std::string lockFileOf(const std::string& path);

private:
    void* key_ = nullptr;
    VelReadResult result_;
};

// French reason for a system error code ("disque plein", "permission refusée"...) and
// what the user can do about it.
std::string velFileErrorReason(int error);
std::string velFileErrorAdvice(int error);

// The system calls behind the writer and the lock. Tests replace them to make any one
// of them fail as a full disk or a lost network share would; velResetFileSystemCalls()
// puts the real ones back.
struct VelFileSystemCalls {
    int (*open)(const char* path, int flags, mode_t mode);
    ssize_t (*write)(int fd, const void* data, size_t size);
    int (*fsync)(int fd);
    int (*close)(int fd);
    int (*rename)(const char* from, const char* to);
    int (*link)(const char* from, const char* to);
};
VelFileSystemCalls& velFileSystemCalls();
void velResetFileSystemCalls();

#pragma GCC visibility pop
