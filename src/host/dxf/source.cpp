// Reading a drawing file whole into memory of its own, in large pages where the system
// has them.
#include "host/dxf/source.hpp"

#include <fcntl.h>
#include <sys/mman.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace vel::dxf {

Source::~Source()
{
    if (buffer_ != nullptr)
        munmap(buffer_, capacity_);
}

VelReadResult Source::Load(const std::string& path)
{
    const int fd = open(path.c_str(), O_RDONLY | O_CLOEXEC);
    if (fd < 0) {
        const int err = errno;
        return VelReadResult::Failed(err == ENOENT ? VelReadStatus::kNotFound : VelReadStatus::kCannotOpen, path, err);
    }
    struct stat st {};
    if (fstat(fd, &st) != 0 || !S_ISREG(st.st_mode)) {
        close(fd);
        return VelReadResult::Failed(VelReadStatus::kNotAFile, path);
    }
    const auto fail = [&](int err) {
        close(fd);
        return VelReadResult::Failed(VelReadStatus::kCannotRead, path, err);
    };
    // Memory of its own rather than the heap: in large pages where the system has them,
    // filling it costs no more than mapping the file did.
    std::size_t capacity = static_cast<std::size_t>(st.st_size) + 1;
    void* buffer = mmap(nullptr, capacity, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (buffer == MAP_FAILED)
        return fail(errno);
    madvise(buffer, capacity, MADV_HUGEPAGE);
    // One read of the size announced; a file that grows meanwhile is read to its end, one
    // that shrinks is what is left of it.
    std::size_t size = 0;
    for (;;) {
        if (size == capacity) {
            void* larger = mremap(buffer, capacity, capacity * 2, MREMAP_MAYMOVE);
            if (larger == MAP_FAILED) {
                munmap(buffer, capacity);
                return fail(errno);
            }
            buffer = larger;
            capacity *= 2;
        }
        const ssize_t n = read(fd, static_cast<char*>(buffer) + size, capacity - size);
        if (n < 0 && errno == EINTR)
            continue;
        if (n < 0) {
            const int err = errno;
            munmap(buffer, capacity);
            return fail(err);
        }
        if (n == 0)
            break;
        size += static_cast<std::size_t>(n);
    }
    close(fd);
    if (buffer_ != nullptr)
        munmap(buffer_, capacity_);
    buffer_ = buffer;
    capacity_ = capacity;
    data_ = static_cast<const char*>(buffer);
    size_ = size;
    return {};
}

void Source::Own(std::string content)
{
    owned_ = std::move(content);
    data_ = owned_.data();
    size_ = owned_.size();
}

} // namespace vel::dxf
