// The identity of a thread.
#include "support/thread_id.h"

namespace {

constexpr pthread_t kNoThread{};

}  // namespace

NiduThreadID::NiduThreadID(NiduThreadID const& other) : thread(other.value()) {}

NiduThreadID& NiduThreadID::operator=(NiduThreadID const& other) {
  set(other.value());
  return *this;
}

NiduThreadID::~NiduThreadID() { set(kNoThread); }

NiduThreadID NiduThreadID::CurrentThread() {
  NiduThreadID current;
  current.set(pthread_self());
  return current;
}

bool NiduThreadID::IsEqual(NiduThreadID const& other) const {
  const pthread_t mine = value();
  const pthread_t others = other.value();
  if (mine == kNoThread || others == kNoThread) return mine == kNoThread && others == kNoThread;
  return mine == others || pthread_equal(mine, others) != 0;
}
