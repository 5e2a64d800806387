// Fault injection: a small table of armed faults behind one "anything armed?" flag.
#include "platform/FaultInjection.h"

#include <atomic>
#include <cstring>
#include <mutex>

#include "platform/Errors.h"

namespace Platform::FaultInjection {
namespace {

struct Fault {
  const char* operation = nullptr;
  bool isShort = false;
  DWORD value = 0;  // the error, or the byte limit of a short transfer
  unsigned skip = 0;
  unsigned times = 0;  // kForever or the calls still to hit
};

std::atomic<int> g_armed{0};  // number of live faults
std::atomic<unsigned> g_hits{0};
std::mutex g_lock;
Fault g_faults[kMaxFaults];

bool Add(const Fault& fault) {
  std::lock_guard<std::mutex> guard(g_lock);
  for (Fault& slot : g_faults) {
    if (slot.operation == nullptr) {
      slot = fault;
      g_hits.store(0, std::memory_order_relaxed);
      g_armed.fetch_add(1, std::memory_order_release);
      return true;
    }
  }
  return false;
}

// Finds the fault of the given kind armed for `operation`, counts this call against it and
// returns it when the call is to be hit (the slot is freed once used up).
bool Take(const char* operation, bool isShort, DWORD& value) noexcept {
  std::lock_guard<std::mutex> guard(g_lock);
  for (Fault& slot : g_faults) {
    if (slot.operation == nullptr || slot.isShort != isShort || std::strcmp(slot.operation, operation) != 0) {
      continue;
    }
    if (slot.skip > 0) {
      --slot.skip;
      continue;
    }
    value = slot.value;
    if (slot.times != kForever && --slot.times == 0) {
      slot = Fault{};
      g_armed.fetch_sub(1, std::memory_order_release);
    }
    g_hits.fetch_add(1, std::memory_order_relaxed);
    return true;
  }
  return false;
}

}  // namespace

bool Arm(const char* operation, DWORD error, unsigned skip, unsigned times) {
  if (operation == nullptr) return false;
  return Add(Fault{operation, false, error, skip, times});
}

bool ArmShort(const char* operation, DWORD maxBytes, unsigned skip, unsigned times) {
  if (operation == nullptr) return false;
  return Add(Fault{operation, true, maxBytes, skip, times});
}

void Disarm() {
  std::lock_guard<std::mutex> guard(g_lock);
  for (Fault& slot : g_faults) slot = Fault{};
  g_armed.store(0, std::memory_order_release);
  g_hits.store(0, std::memory_order_relaxed);
}

bool Check(const char* operation) noexcept {
  if (g_armed.load(std::memory_order_relaxed) == 0) return false;
  DWORD error = 0;
  if (!Take(operation, false, error)) return false;
  SetLastError(error);
  return true;
}

DWORD LimitTransfer(const char* operation, DWORD requested) noexcept {
  if (g_armed.load(std::memory_order_relaxed) == 0) return requested;
  DWORD limit = 0;
  if (!Take(operation, true, limit)) return requested;
  return limit < requested ? limit : requested;
}

unsigned Hits() noexcept { return g_hits.load(std::memory_order_relaxed); }

}  // namespace Platform::FaultInjection
