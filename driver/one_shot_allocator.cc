// operator new and delete for a one-shot process. Each start compiles the
// same patterns several times and frees their nodes again; small blocks are
// therefore kept on per-size free lists and handed out again, instead of
// going round malloc's bins each time. Large blocks go straight to malloc.
// Linked into the vell binary only, and not into sanitizer builds, whose
// allocator must see every block.
#include <cstddef>
#include <cstdlib>
#include <new>

namespace {

constexpr std::size_t granule = 16;
constexpr std::size_t size_classes = 16;  // blocks of up to 256 bytes are kept
// Every block starts with a header holding its size class (0: a large
// block); 16 bytes keep the block as aligned as malloc's.
constexpr std::size_t header = 16;

struct free_block {
  free_block* next;
};
free_block* free_lists[size_classes];

void* allocate(std::size_t size) noexcept {
  const std::size_t size_class = size == 0 ? 1 : (size + granule - 1) / granule;
  if (size_class <= size_classes) {
    if (free_block* block = free_lists[size_class - 1]) {
      free_lists[size_class - 1] = block->next;
      return block;
    }
    size = size_class * granule;
  }
  char* raw = static_cast<char*>(std::malloc(header + size));
  if (raw == nullptr) return nullptr;
  *reinterpret_cast<std::size_t*>(raw) = size_class <= size_classes ? size_class : 0;
  return raw + header;
}

void release(void* block) noexcept {
  if (block == nullptr) return;
  char* raw = static_cast<char*>(block) - header;
  const std::size_t size_class = *reinterpret_cast<std::size_t*>(raw);
  if (size_class == 0) {
    std::free(raw);
    return;
  }
  auto* freed = static_cast<free_block*>(block);
  freed->next = free_lists[size_class - 1];
  free_lists[size_class - 1] = freed;
}

void* allocate_or_throw(std::size_t size) {
  void* block = allocate(size);
  if (block == nullptr) throw std::bad_alloc();
  return block;
}

}  // namespace

void* operator new(std::size_t size) { return allocate_or_throw(size); }
void* operator new[](std::size_t size) { return allocate_or_throw(size); }
void* operator new(std::size_t size, const std::nothrow_t&) noexcept { return allocate(size); }
void* operator new[](std::size_t size, const std::nothrow_t&) noexcept { return allocate(size); }
void operator delete(void* block) noexcept { release(block); }
void operator delete[](void* block) noexcept { release(block); }
void operator delete(void* block, std::size_t) noexcept { release(block); }
void operator delete[](void* block, std::size_t) noexcept { release(block); }
void operator delete(void* block, const std::nothrow_t&) noexcept { release(block); }
void operator delete[](void* block, const std::nothrow_t&) noexcept { release(block); }
