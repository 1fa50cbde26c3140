// Interrupted writes: makes the Nth system call of the host's file writer fail as a full
// disk or a lost share would, and runs an operation once for every N it makes.
#pragma once

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <functional>
#include <string>

#include "velhost/files.h"

// What happened during one run.
struct FaultRun {
    int calls = 0;
    // The call that failed ("write"...) and its error; empty when none did.
    std::string failed;
    int error = 0;
    // A rename other than the backup's succeeded: the new version was in place.
    bool committed = false;
};

class FileFaults {
public:
    // Fails call number `failAt` (from 1; 0 fails none) with the error its kind gets.
    explicit FileFaults(int failAt) : failAt_(failAt)
    {
        current_ = this;
        VelFileSystemCalls& calls = velFileSystemCalls();
        calls.open = &Open;
        calls.write = &Write;
        calls.fsync = &Fsync;
        calls.close = &Close;
        calls.rename = &Rename;
        calls.link = &Link;
    }
    ~FileFaults()
    {
        velResetFileSystemCalls();
        current_ = nullptr;
    }
    FileFaults(const FileFaults&) = delete;
    FileFaults& operator=(const FileFaults&) = delete;

    FaultRun run;

    // The error each kind of call fails with, so that every reason is told once.
    static int ErrorOf(const std::string& call)
    {
        if (call == "open")
            return EACCES;
        if (call == "write")
            return ENOSPC;
        if (call == "fsync")
            return EIO;
        if (call == "close")
            return EDQUOT;
        if (call == "link")
            return EROFS;
        return EROFS;
    }

private:
    bool Fail(const char* call)
    {
        if (++run.calls != failAt_)
            return false;
        run.failed = call;
        run.error = ErrorOf(call);
        errno = run.error;
        return true;
    }
    static int Open(const char* path, int flags, mode_t mode)
    {
        return current_->Fail("open") ? -1 : ::open(path, flags, mode);
    }
    static ssize_t Write(int fd, const void* data, size_t size)
    {
        return current_->Fail("write") ? -1 : ::write(fd, data, size);
    }
    static int Fsync(int fd) { return current_->Fail("fsync") ? -1 : ::fsync(fd); }
    static int Close(int fd)
    {
        // The descriptor goes either way, as it does when a network share reports a
        // failed write at close.
        const bool failing = current_->Fail("close");
        const int result = ::close(fd);
        if (failing) {
            errno = current_->run.error;
            return -1;
        }
        return result;
    }
    static int Rename(const char* from, const char* to)
    {
        if (current_->Fail("rename"))
            return -1;
        const int result = ::rename(from, to);
        const std::string target = to;
        if (result == 0 && (target.size() < 4 || target.compare(target.size() - 4, 4, ".bak") != 0))
            current_->run.committed = true;
        return result;
    }
    static int Link(const char* from, const char* to) { return current_->Fail("link") ? -1 : ::link(from, to); }

    int failAt_;
    static inline FileFaults* current_ = nullptr;
};

// Runs `operation` once without faults to count its calls, then once more for every call
// number N with that call failing, `prepare` before each run and `check` after it (with
// the real calls back). Answers the number of calls.
inline int ForEveryFailingCall(const std::function<void()>& prepare, const std::function<void()>& operation,
                               const std::function<void(const FaultRun&)>& check)
{
    int total = 0;
    {
        prepare();
        FileFaults counting(0);
        operation();
        total = counting.run.calls;
    }
    for (int n = 1; n <= total; ++n) {
        prepare();
        FaultRun run;
        {
            FileFaults faults(n);
            operation();
            run = faults.run;
        }
        check(run);
    }
    return total;
}
