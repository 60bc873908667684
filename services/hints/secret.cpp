#include "services/hints/secret.h"

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>
#include <new>
#include <utility>

namespace vlm::service {
namespace {

// Whole pages, so that locking and unlocking never touches a neighbour's memory.
std::size_t pagesFor(std::size_t size) {
    const auto page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    return (size + page - 1) / page * page;
}

}  // namespace

Secret::Secret(std::string_view text) : Secret(ofSize(text.size())) {
    std::ranges::copy(text, _text);
}

Secret Secret::ofSize(std::size_t size) {
    Secret secret;
    if (size == 0) return secret;
    void* memory =
        mmap(nullptr, pagesFor(size), PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (memory == MAP_FAILED) throw std::bad_alloc();
    mlock(memory, pagesFor(size));
    madvise(memory, pagesFor(size), MADV_DONTDUMP);
    secret._text = static_cast<char*>(memory);
    secret._size = secret._capacity = size;
    return secret;
}

Secret::Secret(Secret&& other) noexcept
    : _text(std::exchange(other._text, nullptr)),
      _size(std::exchange(other._size, 0)),
      _capacity(std::exchange(other._capacity, 0)) {}

Secret& Secret::operator=(Secret&& other) noexcept {
    if (this == &other) return *this;
    wipe();
    _text = std::exchange(other._text, nullptr);
    _size = std::exchange(other._size, 0);
    _capacity = std::exchange(other._capacity, 0);
    return *this;
}

Secret::~Secret() { wipe(); }

void Secret::shorten(std::size_t size) {
    if (size >= _size) return;
    wipeMemory(memory().subspan(size));
    _size = size;
}

void Secret::wipe() {
    if (_text == nullptr) return;
    wipeMemory({_text, _capacity});
    munmap(_text, pagesFor(_capacity));
    _text = nullptr;
    _size = _capacity = 0;
}

void wipeMemory(std::span<char> memory) {
    if (!memory.empty()) explicit_bzero(memory.data(), memory.size());
}

}  // namespace vlm::service
