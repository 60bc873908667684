#include "watched_memory.h"

#include <malloc.h>

#include <cstdlib>
#include <new>

namespace vlm::test {

std::size_t largestPiece = kAnySize;
std::string_view secret;
int piecesWithSecret = 0;

namespace {

void search(void* piece) {
    if (secret.empty() || !piece) return;
    const std::string_view content(static_cast<const char*>(piece), malloc_usable_size(piece));
    if (content.find(secret) != std::string_view::npos) ++piecesWithSecret;
}

}  // namespace

}  // namespace vlm::test

void* operator new(std::size_t size) {
    void* piece = size > vlm::test::largestPiece ? nullptr : std::malloc(size == 0 ? 1 : size);
    if (!piece) throw std::bad_alloc();
    return piece;
}

void operator delete(void* piece) noexcept {
    vlm::test::search(piece);
    std::free(piece);
}

void operator delete(void* piece, std::size_t) noexcept { operator delete(piece); }
