#include "faults/fault_injection.h"

#include <atomic>
#include <cstddef>
#include <cstdlib>
#include <new>
#include <string_view>
#include <system_error>

#include <openssl/crypto.h>
#include <openssl/evp.h>
#include <pthread.h>

extern "C" void* __real_malloc(std::size_t size);

namespace SsoClient::Testing {
namespace {

struct Plan {
  std::atomic<bool> isArmed{false};
  FaultKind kind = FaultKind::kAllocation;
  std::atomic<std::size_t> callsToGo{0};
  int result = 0;
  std::atomic<bool> hasHappened{false};
};

Plan plan;
std::atomic<bool> isMemoryShort{false};

bool Fails(FaultKind kind) noexcept {
  if (!plan.isArmed || plan.kind != kind || plan.hasHappened || plan.callsToGo-- != 0) {
    return false;
  }
  plan.hasHappened = true;
  return true;
}

/// The kind of allocations that a thread of the pool makes.
FaultKind KindOnThisThread() noexcept {
  static constinit thread_local FaultKind kind = FaultKind::kAllocation;
  static constinit thread_local bool isKnown = false;
  // A thread has its name when it runs its first item.
  if (!isKnown && plan.isArmed) {
    isKnown = true;
    char name[16] = "";
    pthread_getname_np(pthread_self(), name, sizeof(name));
    const std::string_view text = name;
    kind = text == "tarnik-io"         ? FaultKind::kIoThreadAllocation
           : text == "tarnik-worker"   ? FaultKind::kWorkerAllocation
           : text == kCallerThreadName ? FaultKind::kCallerAllocation
                                       : FaultKind::kAllocation;
  }
  return kind;
}

bool FailsOnThisThread() noexcept {
  const FaultKind kind = KindOnThisThread();
  return kind != FaultKind::kAllocation && Fails(kind);
}

void* Allocate(std::size_t size) noexcept {
  return isMemoryShort || Fails(FaultKind::kAllocation) || FailsOnThisThread()
             ? nullptr
             : __real_malloc(size);
}

void* AllocateInOpenSsl(std::size_t size, const char* /*file*/, int /*line*/) noexcept {
  return size == 0 || isMemoryShort || Fails(FaultKind::kOpenSslAllocation) || FailsOnThisThread()
             ? nullptr
             : __real_malloc(size);
}

void* ReallocateInOpenSsl(void* memory, std::size_t size, const char* /*file*/,
                          int /*line*/) noexcept {
  if (size == 0) {
    std::free(memory);
    return nullptr;
  }
  return isMemoryShort || Fails(FaultKind::kOpenSslAllocation) || FailsOnThisThread()
             ? nullptr
             : std::realloc(memory, size);
}

void FreeInOpenSsl(void* memory, const char* /*file*/, int /*line*/) noexcept {
  std::free(memory);
}

// OpenSSL accepts other functions only before its first allocation, which is made when the library
// under test is initialised.
[[gnu::constructor(101)]] void ReplaceOpenSslMemory() {
  if (CRYPTO_set_mem_functions(AllocateInOpenSsl, ReallocateInOpenSsl, FreeInOpenSsl) != 1) {
    std::abort();
  }
}

}  // namespace

InjectedFault::InjectedFault(FaultKind kind, std::size_t index, int result) noexcept {
  plan.kind = kind;
  plan.callsToGo = index;
  plan.result = result;
  plan.hasHappened = false;
  plan.isArmed = true;
}

InjectedFault::~InjectedFault() {
  Disarm();
}

void InjectedFault::Disarm() noexcept {
  plan.isArmed = false;
}

bool InjectedFault::HasHappened() const noexcept {
  return plan.hasHappened;
}

MemoryShortage::MemoryShortage() noexcept {
  isMemoryShort = true;
}

MemoryShortage::~MemoryShortage() {
  isMemoryShort = false;
}

}  // namespace SsoClient::Testing

void* operator new(std::size_t size) {
  void* memory = SsoClient::Testing::Allocate(size);
  if (memory == nullptr) {
    throw std::bad_alloc();
  }
  return memory;
}

void operator delete(void* memory) noexcept {
  std::free(memory);
}

void operator delete(void* memory, std::size_t) noexcept {
  std::free(memory);
}

// The linker redirects the calls of the libraries under test to these functions (option --wrap).
extern "C" {

void* __wrap_malloc(std::size_t size) {
  return SsoClient::Testing::Allocate(size);
}

int __real_EVP_DigestInit_ex2(EVP_MD_CTX* context, const EVP_MD* type, const OSSL_PARAM* params);
int __wrap_EVP_DigestInit_ex2(EVP_MD_CTX* context, const EVP_MD* type, const OSSL_PARAM* params) {
  return SsoClient::Testing::Fails(SsoClient::Testing::FaultKind::kCrypto)
             ? SsoClient::Testing::plan.result
             : __real_EVP_DigestInit_ex2(context, type, params);
}

int __real_EVP_DigestUpdate(EVP_MD_CTX* context, const void* data, std::size_t size);
int __wrap_EVP_DigestUpdate(EVP_MD_CTX* context, const void* data, std::size_t size) {
  return SsoClient::Testing::Fails(SsoClient::Testing::FaultKind::kCrypto)
             ? SsoClient::Testing::plan.result
             : __real_EVP_DigestUpdate(context, data, size);
}

int __real_EVP_DigestFinal_ex(EVP_MD_CTX* context, unsigned char* digest, unsigned* size);
int __wrap_EVP_DigestFinal_ex(EVP_MD_CTX* context, unsigned char* digest, unsigned* size) {
  return SsoClient::Testing::Fails(SsoClient::Testing::FaultKind::kCrypto)
             ? SsoClient::Testing::plan.result
             : __real_EVP_DigestFinal_ex(context, digest, size);
}

int __real_EVP_PKEY_verify(EVP_PKEY_CTX* context, const unsigned char* signature,
                           std::size_t signatureSize, const unsigned char* digest,
                           std::size_t digestSize);
int __wrap_EVP_PKEY_verify(EVP_PKEY_CTX* context, const unsigned char* signature,
                           std::size_t signatureSize, const unsigned char* digest,
                           std::size_t digestSize) {
  return SsoClient::Testing::Fails(SsoClient::Testing::FaultKind::kCrypto)
             ? SsoClient::Testing::plan.result
             : __real_EVP_PKEY_verify(context, signature, signatureSize, digest, digestSize);
}

int __real_EVP_PKEY_sign(EVP_PKEY_CTX* context, unsigned char* signature,
                         std::size_t* signatureSize, const unsigned char* digest,
                         std::size_t digestSize);
int __wrap_EVP_PKEY_sign(EVP_PKEY_CTX* context, unsigned char* signature,
                         std::size_t* signatureSize, const unsigned char* digest,
                         std::size_t digestSize) {
  return SsoClient::Testing::Fails(SsoClient::Testing::FaultKind::kCrypto)
             ? SsoClient::Testing::plan.result
             : __real_EVP_PKEY_sign(context, signature, signatureSize, digest, digestSize);
}

// std::thread::_M_start_thread(std::unique_ptr<std::thread::_State>, void (*)()): this object and
// the address of the first argument.
void __real__ZNSt6thread15_M_start_threadESt10unique_ptrINS_6_StateESt14default_deleteIS1_EEPFvvE(
    void* thread, void* state, void (*depend)());
void __wrap__ZNSt6thread15_M_start_threadESt10unique_ptrINS_6_StateESt14default_deleteIS1_EEPFvvE(
    void* thread, void* state, void (*depend)()) {
  if (SsoClient::Testing::Fails(SsoClient::Testing::FaultKind::kThreadStart)) {
    throw std::system_error(std::make_error_code(std::errc::resource_unavailable_try_again));
  }
  __real__ZNSt6thread15_M_start_threadESt10unique_ptrINS_6_StateESt14default_deleteIS1_EEPFvvE(
      thread, state, depend);
}
}
