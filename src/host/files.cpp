// The one way the host and its modules write a file: a temporary file beside the target,
// flushed and renamed over it; also the identity of a file and the lock between processes.
#include "velhost/files.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <chrono>
#include <cstring>
#include <filesystem>
#include <map>
#include <mutex>
#include <random>
#include <thread>
#include <utility>

#include "text/text.hpp"

namespace fs = std::filesystem;

namespace {

int RealOpen(const char* path, int flags, mode_t mode)
{
    return ::open(path, flags, mode);
}

const VelFileSystemCalls kRealCalls = {&RealOpen, &::write, &::fsync, &::close, &::rename, &::link};

VelFileSystemCalls& Calls()
{
    static VelFileSystemCalls calls = kRealCalls;
    return calls;
}

// Follows symbolic links, so that the file they name is replaced and the link stays.
std::string ResolveLinks(const std::string& path)
{
    std::string target = path;
    for (int hops = 0; hops < 40; ++hops) {
        struct stat st {};
        if (::lstat(target.c_str(), &st) != 0 || !S_ISLNK(st.st_mode))
            break;
        std::error_code ec;
        const fs::path link = fs::read_symlink(target, ec);
        if (ec)
            break;
        target = (link.is_absolute() ? link : fs::path(target).parent_path() / link).lexically_normal().string();
    }
    return target;
}

fs::path FolderOf(const std::string& path)
{
    const fs::path folder = fs::path(path).parent_path();
    return folder.empty() ? fs::path(".") : folder;
}

// A name beside the file that nothing else uses: ".<name><tag><random>".
std::string SiblingName(const std::string& path, const char* tag)
{
    static thread_local std::mt19937_64 random{std::random_device{}()};
    static const char kLetters[] = "abcdefghijklmnopqrstuvwxyz0123456789";
    std::string suffix;
    for (int i = 0; i < 8; ++i)
        suffix += kLetters[random() % (sizeof kLetters - 1)];
    return (FolderOf(path) / ("." + fs::path(path).filename().string() + tag + suffix)).string();
}

mode_t CurrentUmask()
{
    const mode_t mask = ::umask(0);
    ::umask(mask);
    return mask;
}

bool WriteAll(int fd, std::string_view content, int& error)
{
    while (!content.empty()) {
        const ssize_t written = Calls().write(fd, content.data(), content.size());
        if (written < 0) {
            if (errno == EINTR)
                continue;
            error = errno;
            return false;
        }
        if (written == 0) {
            error = EIO;
            return false;
        }
        content.remove_prefix(static_cast<std::size_t>(written));
    }
    return true;
}

// A copy of the file under a new name, for file systems without hard links.
bool CopyFile(const std::string& from, const std::string& to, int& error)
{
    const int in = ::open(from.c_str(), O_RDONLY | O_CLOEXEC);
    if (in < 0) {
        error = errno;
        return false;
    }
    struct stat st {};
    ::fstat(in, &st);
    const int out = Calls().open(to.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, st.st_mode & 07777);
    if (out < 0) {
        error = errno;
        ::close(in);
        return false;
    }
    char buffer[1 << 16];
    bool ok = true;
    for (;;) {
        const ssize_t n = ::read(in, buffer, sizeof buffer);
        if (n < 0 && errno == EINTR)
            continue;
        if (n < 0) {
            error = errno;
            ok = false;
            break;
        }
        if (n == 0)
            break;
        if (!WriteAll(out, std::string_view(buffer, static_cast<std::size_t>(n)), error)) {
            ok = false;
            break;
        }
    }
    if (ok && Calls().fsync(out) != 0) {
        error = errno;
        ok = false;
    }
    if (Calls().close(out) != 0 && ok) {
        error = errno;
        ok = false;
    }
    ::close(in);
    if (!ok)
        ::unlink(to.c_str());
    return ok;
}

// A second name for the file as it is now, beside it: the backup to be, put in place only
// once the new version is.
bool StageBackup(const std::string& path, std::string& staging, int& error)
{
    for (int attempt = 0;; ++attempt) {
        staging = SiblingName(path, ".bak-");
        if (Calls().link(path.c_str(), staging.c_str()) == 0)
            return true;
        if (errno == EEXIST && attempt < 100)
            continue;
        // File systems without hard links (some network shares) get a copy.
        if (errno != EPERM && errno != EXDEV && errno != ENOTSUP && errno != EMLINK && errno != ENOSYS) {
            error = errno;
            staging.clear();
            return false;
        }
        if (!CopyFile(path, staging, error)) {
            staging.clear();
            return false;
        }
        return true;
    }
}

std::string Failure(const std::string& path, const std::string& step, int error, bool existed)
{
    return FormatString("Fichier « %s » non enregistré : %s%s%s%s. %s ; %s.", path.c_str(),
                        velFileErrorReason(error).c_str(), step.empty() ? "" : " (", step.c_str(),
                        step.empty() ? "" : ")",
                        existed ? "Le fichier précédent est conservé tel quel" : "Aucun fichier n'a été créé",
                        velFileErrorAdvice(error).c_str());
}

std::uint64_t Mix(std::uint64_t h)
{
    h ^= h >> 33;
    h *= 0xff51afd7ed558ccdULL;
    h ^= h >> 33;
    h *= 0xc4ceb9fe1a85ec53ULL;
    return h ^ (h >> 33);
}

// The hash of a file's bytes, fed in pieces of any size. Four lanes of eight bytes each
// take every fourth word, so that the multiplications of neighbouring words overlap and
// the hash keeps up with reading; each word is multiplied and rotated into its lane, so
// that swapped or shifted bytes tell. The length is mixed in at the end.
class ContentHash {
public:
    void update(const char* data, std::size_t size)
    {
        total_ += size;
        if (pendingSize_ > 0) {
            const std::size_t take = std::min(size, kStripe - pendingSize_);
            std::memcpy(pending_ + pendingSize_, data, take);
            pendingSize_ += take;
            data += take;
            size -= take;
            if (pendingSize_ < kStripe)
                return;
            stripes(pending_, kStripe);
            pendingSize_ = 0;
        }
        const std::size_t whole = size - size % kStripe;
        stripes(data, whole);
        std::memcpy(pending_, data + whole, size - whole);
        pendingSize_ = size - whole;
    }

    std::uint64_t final() const
    {
        ContentHash last = *this;
        if (last.pendingSize_ > 0) {
            std::memset(last.pending_ + last.pendingSize_, 0, kStripe - last.pendingSize_);
            last.stripes(last.pending_, kStripe);
        }
        std::uint64_t h = last.total_;
        for (const std::uint64_t lane : last.lane_)
            h = Mix(h ^ lane) + kPrime1;
        return Mix(h);
    }

private:
    static constexpr std::size_t kStripe = 32;
    static constexpr std::uint64_t kPrime1 = 0x9e3779b185ebca87ULL;
    static constexpr std::uint64_t kPrime2 = 0xc2b2ae3d27d4eb4fULL;

    static std::uint64_t Round(std::uint64_t lane, std::uint64_t word)
    {
        lane += word * kPrime2;
        return ((lane << 31) | (lane >> 33)) * kPrime1;
    }

    void stripes(const char* data, std::size_t size)
    {
        std::uint64_t a = lane_[0], b = lane_[1], c = lane_[2], d = lane_[3];
        for (std::size_t i = 0; i < size; i += kStripe) {
            std::uint64_t w[4];
            std::memcpy(w, data + i, kStripe);
            a = Round(a, w[0]);
            b = Round(b, w[1]);
            c = Round(c, w[2]);
            d = Round(d, w[3]);
        }
        lane_[0] = a, lane_[1] = b, lane_[2] = c, lane_[3] = d;
    }

    std::uint64_t lane_[4] = {kPrime1 + kPrime2, kPrime2, 0, 0 - kPrime1};
    char pending_[kStripe] = {};
    std::size_t pendingSize_ = 0;
    std::uint64_t total_ = 0;
};

std::int64_t ModifiedOf(const struct stat& st)
{
    return static_cast<std::int64_t>(st.st_mtim.tv_sec) * 1000000000 + st.st_mtim.tv_nsec;
}

// The last file that velReadFile read in this thread.
struct LastRead {
    std::uint64_t count = 0;
    std::string path;
    VelFileIdentity identity;
};

LastRead& LastReadOfThread()
{
    static thread_local LastRead last;
    return last;
}

} // namespace

std::string velFileErrorReason(int error)
{
    switch (error) {
    case ENOSPC:
        return "disque plein";
    case EDQUOT:
        return "quota disque dépassé";
    case EACCES:
    case EPERM:
        return "permission refusée";
    case EROFS:
        return "dossier en lecture seule";
    case ENOENT:
    case ENOTDIR:
        return "dossier introuvable";
    case EISDIR:
        return "un dossier porte ce nom";
    case EFBIG:
        return "fichier trop gros pour ce disque";
    case EIO:
        return "erreur d'entrée-sortie du disque ou du réseau";
    case ENAMETOOLONG:
        return "nom de fichier trop long";
    case EMFILE:
    case ENFILE:
        return "trop de fichiers ouverts";
    case EAGAIN:
        return "fichier verrouillé par un autre programme";
    case ENOLCK:
        return "verrou impossible sur ce disque";
    default:
        return FormatString("erreur système %d, %s", error, std::strerror(error));
    }
}

std::string velFileErrorAdvice(int error)
{
    switch (error) {
    case ENOSPC:
        return "libérez de la place sur le disque, puis recommencez";
    case EDQUOT:
        return "libérez de la place ou faites augmenter votre quota, puis recommencez";
    case EACCES:
    case EPERM:
        return "vérifiez vos droits d'écriture sur le fichier et sur son dossier";
    case EROFS:
        return "enregistrez dans un autre dossier";
    case ENOENT:
    case ENOTDIR:
        return "vérifiez le chemin du fichier";
    case EAGAIN:
        return "attendez que l'autre enregistrement se termine, puis recommencez";
    case EIO:
        return "vérifiez le disque ou la connexion au partage, puis recommencez";
    default:
        return "corrigez la cause, puis recommencez";
    }
}

VelFileSystemCalls& velFileSystemCalls()
{
    return Calls();
}

void velResetFileSystemCalls()
{
    Calls() = kRealCalls;
}

// ---- writer ----

VelAtomicFile::VelAtomicFile(std::string path, VelWriteOptions options)
    : path_(std::move(path)), target_(ResolveLinks(path_)), options_(options)
{}

VelAtomicFile::~VelAtomicFile()
{
    discard();
}

VelReadResult VelAtomicFile::fail(const char* step, int error)
{
    discard();
    return VelReadResult::Failed(VelReadStatus::kCannotWrite, path_, error, Failure(path_, step, error, existed_));
}

VelReadResult VelAtomicFile::open()
{
    discard();
    struct stat st {};
    existed_ = ::stat(target_.c_str(), &st) == 0;
    if (existed_ && S_ISDIR(st.st_mode))
        return VelReadResult::Failed(VelReadStatus::kCannotWrite, path_, EISDIR, Failure(path_, "", EISDIR, false));
    // A rename would replace a file its owner protected from writing: it is refused as a
    // write into it would be.
    if (existed_ && ::access(target_.c_str(), W_OK) != 0) {
        const int error = errno;
        return VelReadResult::Failed(VelReadStatus::kCannotWrite, path_, error,
                                     Failure(path_, "le fichier est protégé en écriture", error, true));
    }
    for (int attempt = 0;; ++attempt) {
        temporary_ = SiblingName(target_, ".tmp-");
        fd_ = Calls().open(temporary_.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_CLOEXEC, 0600);
        if (fd_ >= 0)
            return {};
        const int error = errno;
        temporary_.clear();
        if (error != EEXIST || attempt >= 100)
            return fail("pendant la création du fichier temporaire", error);
    }
}

VelReadResult VelAtomicFile::write(std::string_view piece)
{
    if (fd_ < 0)
        return VelReadResult::Failed(VelReadStatus::kCannotWrite, path_, EBADF,
                                     Failure(path_, "fichier temporaire absent", EBADF, existed_));
    int error = 0;
    if (!WriteAll(fd_, piece, error))
        return fail("pendant l'écriture", error);
    return {};
}

VelReadResult VelAtomicFile::commit()
{
    if (fd_ < 0)
        return VelReadResult::Failed(VelReadStatus::kCannotWrite, path_, EBADF,
                                     Failure(path_, "fichier temporaire absent", EBADF, existed_));
    // A library given the temporary file's name may have replaced it: flush what is there.
    struct stat ours {
    }, named{};
    if (::fstat(fd_, &ours) != 0 || ::stat(temporary_.c_str(), &named) != 0)
        return fail("pendant l'écriture", errno);
    if (ours.st_ino != named.st_ino || ours.st_dev != named.st_dev) {
        Calls().close(fd_);
        fd_ = Calls().open(temporary_.c_str(), O_RDONLY | O_CLOEXEC, 0);
        if (fd_ < 0)
            return fail("pendant l'écriture", errno);
    }
    // The new version keeps the permissions and, where allowed, the group of the old one,
    // so that the other users of a shared folder still reach it.
    struct stat old {};
    if (existed_ && ::stat(target_.c_str(), &old) == 0) {
        ::fchmod(fd_, old.st_mode & 07777);
        if (old.st_gid != ours.st_gid && ::fchown(fd_, static_cast<uid_t>(-1), old.st_gid) == 0)
            ::fchmod(fd_, old.st_mode & 07777);
    } else {
        ::fchmod(fd_, 0666 & ~CurrentUmask());
    }
    if (Calls().fsync(fd_) != 0)
        return fail("pendant la mise sur disque", errno);
    const int fd = fd_;
    fd_ = -1;
    if (Calls().close(fd) != 0)
        return fail("pendant l'écriture", errno);
    int backupError = 0;
    std::string staging;
    if (existed_ && options_.keepBackup && !StageBackup(target_, staging, backupError))
        return fail("pendant la copie de sauvegarde", backupError);
    if (Calls().rename(temporary_.c_str(), target_.c_str()) != 0) {
        const int error = errno;
        if (!staging.empty())
            ::unlink(staging.c_str());
        return fail("pendant le remplacement du fichier", error);
    }
    temporary_.clear();
    // The rename is done: the new version is in place whatever follows.
    VelReadResult result;
    if (!staging.empty() && Calls().rename(staging.c_str(), (target_ + ".bak").c_str()) != 0) {
        result.error = errno;
        ::unlink(staging.c_str());
        result.message =
            FormatString("Fichier « %s » enregistré, mais sa copie de sauvegarde « %s.bak » n'a pas pu être "
                         "mise à jour (%s) : elle garde une version plus ancienne.",
                         path_.c_str(), path_.c_str(), velFileErrorReason(result.error).c_str());
    }
    const int folder = Calls().open(FolderOf(target_).c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC, 0);
    int error = folder < 0 ? errno : 0;
    if (folder >= 0 && Calls().fsync(folder) != 0)
        error = errno;
    if (folder >= 0 && Calls().close(folder) != 0 && error == 0)
        error = errno;
    if (error != 0 && result.message.empty()) {
        result.error = error;
        result.message = FormatString(
            "Fichier « %s » enregistré, mais son dossier n'a pas pu être mis sur disque (%s) : après une coupure "
            "de courant, la version précédente pourrait revenir.",
            path_.c_str(), velFileErrorReason(error).c_str());
    }
    return result;
}

void VelAtomicFile::discard()
{
    if (fd_ >= 0)
        ::close(fd_);
    fd_ = -1;
    if (!temporary_.empty())
        ::unlink(temporary_.c_str());
    temporary_.clear();
}

VelReadResult velWriteFileAtomically(const std::string& path, std::string_view content, const VelWriteOptions& options)
{
    VelAtomicFile file(path, options);
    if (VelReadResult opened = file.open(); !opened)
        return opened;
    if (VelReadResult written = file.write(content); !written)
        return written;
    return file.commit();
}

// ---- identity ----

bool VelFileIdentity::sameContent(const VelFileIdentity& other) const
{
    if (exists != other.exists)
        return false;
    return !exists || (readable && other.readable && size == other.size && hash == other.hash);
}

VelFileIdentity velFileIdentity(const std::string& path)
{
    VelFileIdentity identity;
    const int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        identity.exists = errno != ENOENT && errno != ENOTDIR;
        identity.readable = false;
        return identity;
    }
    identity.exists = true;
    struct stat st {};
    if (::fstat(fd, &st) != 0 || !S_ISREG(st.st_mode)) {
        identity.readable = false;
        ::close(fd);
        return identity;
    }
    identity.modified = ModifiedOf(st);
    ContentHash hash;
    std::uint64_t size = 0;
    char buffer[1 << 16];
    for (;;) {
        const ssize_t n = ::read(fd, buffer, sizeof buffer);
        if (n < 0 && errno == EINTR)
            continue;
        if (n < 0) {
            identity.readable = false;
            break;
        }
        if (n == 0)
            break;
        hash.update(buffer, static_cast<std::size_t>(n));
        size += static_cast<std::uint64_t>(n);
    }
    ::close(fd);
    identity.size = size;
    identity.hash = hash.final();
    return identity;
}

VelFileStamp velFileStamp(const std::string& path)
{
    VelFileStamp stamp;
    struct stat st {};
    if (::stat(path.c_str(), &st) != 0)
        return stamp;
    stamp.exists = true;
    stamp.device = static_cast<std::uint64_t>(st.st_dev);
    stamp.inode = static_cast<std::uint64_t>(st.st_ino);
    stamp.size = static_cast<std::uint64_t>(st.st_size);
    stamp.modified = ModifiedOf(st);
    stamp.changed = static_cast<std::int64_t>(st.st_ctim.tv_sec) * 1000000000 + st.st_ctim.tv_nsec;
    return stamp;
}

VelFileContent velReadFile(const std::string& path)
{
    VelFileContent content;
    VelFileIdentity& identity = content.identity;
    const int fd = ::open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        content.error = errno;
        identity.exists = content.error != ENOENT && content.error != ENOTDIR;
        identity.readable = false;
    } else {
        content.opened = true;
        identity.exists = true;
        struct stat st {};
        if (::fstat(fd, &st) != 0) {
            content.error = errno;
            identity.readable = false;
        } else if (!S_ISREG(st.st_mode)) {
            identity.readable = false;
        }
        const std::size_t size = identity.readable ? static_cast<std::size_t>(st.st_size) : 0;
        content.data = std::make_unique_for_overwrite<char[]>(size + 1);
        // Hashed piece by piece as read, while the piece is still in the cache; the size the
        // file announced is what is read.
        constexpr std::size_t kPiece = std::size_t{1} << 20;
        ContentHash hash;
        std::size_t done = 0;
        while (identity.readable && done < size) {
            const ssize_t got = ::read(fd, content.data.get() + done, std::min(kPiece, size - done));
            if (got < 0 && errno == EINTR)
                continue;
            if (got <= 0) {
                content.error = got < 0 ? errno : 0;
                identity.readable = false;
                break;
            }
            hash.update(content.data.get() + done, static_cast<std::size_t>(got));
            done += static_cast<std::size_t>(got);
        }
        ::close(fd);
        content.size = done;
        content.data[done] = '\0';
        identity.modified = ModifiedOf(st);
        identity.size = done;
        identity.hash = hash.final();
    }
    LastRead& last = LastReadOfThread();
    ++last.count;
    last.path = path;
    last.identity = identity;
    return content;
}

std::uint64_t velFileReadMark()
{
    return LastReadOfThread().count;
}

bool velFileReadSince(std::uint64_t mark, const std::string& path, VelFileIdentity& identity)
{
    const LastRead& last = LastReadOfThread();
    if (last.count <= mark || last.path != path)
        return false;
    identity = last.identity;
    return true;
}

// ---- lock ----

namespace {

struct HeldLock {
    int fd = -1;
    int count = 0;
};

std::mutex& LockMutex()
{
    static std::mutex mutex;
    return mutex;
}

std::map<std::pair<dev_t, ino_t>, HeldLock>& HeldLocks()
{
    static std::map<std::pair<dev_t, ino_t>, HeldLock> locks;
    return locks;
}

} // namespace

std::string VelFileLock::lockFileOf(const std::string& path)
{
    const std::string target = ResolveLinks(path);
    return (FolderOf(target) / ("." + fs::path(target).filename().string() + ".verrou")).string();
}

VelFileLock::VelFileLock(const std::string& path, int waitSeconds)
{
    const std::string lockFile = lockFileOf(path);
    const auto failure = [&](int error) {
        const std::string step =
            error == EAGAIN ? FormatString("depuis %d s", waitSeconds) : "pendant la pose du verrou";
        result_ = VelReadResult::Failed(VelReadStatus::kCannotWrite, path, error,
                                        Failure(path, step, error, ::access(path.c_str(), F_OK) == 0));
    };
    if (fs::path(ResolveLinks(path)).filename().empty()) {
        failure(path.empty() ? ENOENT : EISDIR);
        return;
    }
    // Whoever may replace the file may write in its folder, and so may take its lock.
    int fd = Calls().open(lockFile.c_str(), O_RDWR | O_CREAT | O_EXCL | O_CLOEXEC, 0644);
    if (fd >= 0) {
        struct stat folder {};
        if (::stat(FolderOf(lockFile).c_str(), &folder) == 0)
            ::fchmod(fd, 0644 | (folder.st_mode & 0022));
    } else if (errno == EEXIST) {
        fd = Calls().open(lockFile.c_str(), O_RDWR | O_CLOEXEC, 0);
    }
    if (fd < 0) {
        failure(errno);
        return;
    }
    struct stat st {};
    if (::fstat(fd, &st) != 0) {
        failure(errno);
        Calls().close(fd);
        return;
    }
    const std::pair<dev_t, ino_t> key{st.st_dev, st.st_ino};
    std::lock_guard<std::mutex> guard(LockMutex());
    auto& held = HeldLocks();
    if (auto found = held.find(key); found != held.end()) {
        // Held by this process already: our descriptor is a separate open file, whose
        // closing leaves the lock in place.
        ++found->second.count;
        Calls().close(fd);
        key_ = &*found;
        return;
    }
    const auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(waitSeconds);
    struct flock request {};
    request.l_type = F_WRLCK;
    request.l_whence = SEEK_SET;
    for (;;) {
        if (::fcntl(fd, F_OFD_SETLK, &request) == 0)
            break;
        const int error = errno;
        if ((error != EAGAIN && error != EACCES && error != EINTR) || std::chrono::steady_clock::now() >= deadline) {
            failure(error == EACCES ? EAGAIN : error);
            Calls().close(fd);
            return;
        }
        std::this_thread::sleep_for(std::chrono::milliseconds(20));
    }
    key_ = &*held.emplace(key, HeldLock{fd, 1}).first;
}

VelFileLock::~VelFileLock()
{
    if (key_ == nullptr)
        return;
    std::lock_guard<std::mutex> guard(LockMutex());
    auto* entry = static_cast<std::pair<const std::pair<dev_t, ino_t>, HeldLock>*>(key_);
    if (--entry->second.count > 0)
        return;
    ::close(entry->second.fd);
    HeldLocks().erase(entry->first);
}
