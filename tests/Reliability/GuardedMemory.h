// Test helper: arrays that end exactly at an inaccessible page, so that reading or writing one
// element past the end crashes the test program even without a sanitizer. Used by regression
// tests of inputs found by the fuzzers.
#pragma once

#include <sys/mman.h>
#include <unistd.h>

#include <cstddef>
#include <cstring>
#include <stdexcept>

namespace OwTest {

template <typename T>
class GuardedArray {
 public:
  explicit GuardedArray(size_t count) : m_count(count) {
    const size_t page = static_cast<size_t>(::sysconf(_SC_PAGESIZE));
    const size_t bytes = count * sizeof(T);
    m_mapped = ((bytes + page - 1) / page + 1) * page;
    void* base = ::mmap(nullptr, m_mapped, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (base == MAP_FAILED) throw std::runtime_error("mmap failed");
    m_base = static_cast<char*>(base);
    ::mprotect(m_base + m_mapped - page, page, PROT_NONE);
    m_data = reinterpret_cast<T*>(m_base + m_mapped - page - bytes);
  }
  GuardedArray(const T* values, size_t count) : GuardedArray(count) {
    std::memcpy(m_data, values, count * sizeof(T));
  }
  ~GuardedArray() { ::munmap(m_base, m_mapped); }
  GuardedArray(const GuardedArray&) = delete;
  GuardedArray& operator=(const GuardedArray&) = delete;

  T* get() const { return m_data; }
  size_t size() const { return m_count; }

 private:
  char* m_base = nullptr;
  size_t m_mapped = 0;
  T* m_data = nullptr;
  size_t m_count = 0;
};

}  // namespace OwTest
