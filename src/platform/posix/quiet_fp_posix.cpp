// POSIX implementation of platform.h: QuietFloatingPoint.
#include <cfenv>
#include <cstring>

#include "platform/platform.h"

#if defined(__x86_64__) || defined(__i386__)
#include <xmmintrin.h>
#define VOX_QUIET_FP_SSE 1
#endif

namespace vox::platform {

#ifdef VOX_QUIET_FP_SSE
// Double arithmetic runs in SSE on x86-64, so saving and masking MXCSR is enough; it costs a
// few cycles, which matters on the epoch stream's per-satellite path.
QuietFloatingPoint::QuietFloatingPoint() {
  const unsigned int csr = _mm_getcsr();
  std::memcpy(saved_, &csr, sizeof csr);
  _mm_setcsr(csr | _MM_MASK_MASK);
}

QuietFloatingPoint::~QuietFloatingPoint() {
  unsigned int csr;
  std::memcpy(&csr, saved_, sizeof csr);
  _mm_setcsr(csr);
}
#else
static_assert(sizeof(std::fenv_t) <= 64, "saved floating-point state does not fit");

QuietFloatingPoint::QuietFloatingPoint() {
  std::fenv_t env;
  std::feholdexcept(&env);
  std::memcpy(saved_, &env, sizeof env);
}

QuietFloatingPoint::~QuietFloatingPoint() {
  std::fenv_t env;
  std::memcpy(&env, saved_, sizeof env);
  std::fesetenv(&env);
}
#endif

}  // namespace vox::platform
