// Memory that ends at an unreadable page, or that cannot be written.

#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <new>

#include <sys/mman.h>
#include <unistd.h>

// Readable pages with an unreadable page after them. They end at an odd multiple of the page size,
// where no aligned block larger than a page ends.
class ProtectedMemory {
  public:
    explicit ProtectedMemory(const std::size_t bytes)
        : page_(static_cast<std::size_t>(::sysconf(_SC_PAGESIZE))),
          readable_((bytes + page_ - 1) / page_ * page_),
          mapped_(::mmap(nullptr, readable_ + 2 * page_, PROT_READ | PROT_WRITE,
                         MAP_PRIVATE | MAP_ANONYMOUS, -1, 0)) {
        if (mapped_ == MAP_FAILED) {
            throw std::bad_alloc();
        }
        const bool ends_odd =
            (reinterpret_cast<std::uintptr_t>(mapped_) + readable_) / page_ % 2 == 1;
        begin_ = static_cast<unsigned char*>(mapped_) + (ends_odd ? 0 : page_);
        protect(begin_ + readable_, page_, PROT_NONE);
    }
    ProtectedMemory(const ProtectedMemory&) = delete;
    ProtectedMemory& operator=(const ProtectedMemory&) = delete;
    ~ProtectedMemory() { ::munmap(mapped_, readable_ + 2 * page_); }

    // The place from which `bytes` bytes reach up to the unreadable page.
    void* before_end(const std::size_t bytes) const { return begin_ + readable_ - bytes; }

    void make_read_only() const { protect(begin_, readable_, PROT_READ); }

  private:
    static void protect(void* address, const std::size_t bytes, const int protection) {
        if (::mprotect(address, bytes, protection) != 0) {
            throw std::bad_alloc();
        }
    }

    std::size_t page_;
    std::size_t readable_;
    void* mapped_;
    unsigned char* begin_ = nullptr;
};
