#ifndef SSOCLIENT_TESTS_TRANSPORT_SPEC_SLOTS_H
#define SSOCLIENT_TESTS_TRANSPORT_SPEC_SLOTS_H

#include <new>
#include <string>
#include <type_traits>

#include <gtest/gtest.h>

#include <tarnik/core/ref.h>
#include <tarnik/core/weak_linkable_impl.h>
#include <tarnik/http/connection_spec.h>

#include "support/vtable_slot.h"
#include "transport/connect_recorder.h"
#include "transport/loopback_server.h"

namespace SsoClient::Testing {

/// Calls every slot of a connection spec's primary virtual table. `make(port)` makes a spec of
/// 127.0.0.1 and that port with `new`, without a reference.
template <class Make>
void CheckSpecSlots(const Make& make) {
  using VoidFunction = void(const void*);
  using TextFunction = std::string(const void*);
  using BoolFunction = bool(const void*);
  using Spec = std::remove_pointer_t<decltype(make(1))>;

  LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 1), 0);
  const Tarnik::Ref<Spec> spec(make(listener.Port()));
  const void* object = spec.get();

  VtableSlot<VoidFunction>(object, 0)(object);  // IncRef
  EXPECT_EQ(spec->RefCount(), 2);
  VtableSlot<VoidFunction>(object, 1)(object);  // DecRef
  EXPECT_EQ(spec->RefCount(), 1);
  EXPECT_EQ(VtableSlot<TextFunction>(object, 2)(object), spec->ToString());
  EXPECT_EQ(VtableSlot<long(const void*)>(object, 3)(object), 1);
  VtableSlot<VoidFunction>(object, 6)(object);  // the two notifications
  VtableSlot<VoidFunction>(object, 7)(object);
  EXPECT_EQ(spec->RefCount(), 1);

  EXPECT_FALSE(VtableSlot<BoolFunction>(object, 9)(object));  // HasLink
  Tarnik::WeakRef weak;
  VtableSlot<void(const void*, Tarnik::WeakRef&)>(object, 8)(object, weak);
  EXPECT_EQ(weak.Lock().get(), spec.get());
  EXPECT_TRUE(VtableSlot<BoolFunction>(object, 9)(object));

  const std::string key = "127.0.0.1:" + std::to_string(listener.Port());
  EXPECT_EQ(VtableSlot<TextFunction>(object, 10)(object), "127.0.0.1");
  EXPECT_EQ(VtableSlot<TextFunction>(object, 11)(object), "127.0.0.1");
  EXPECT_EQ(VtableSlot<TextFunction>(object, 12)(object), key);
  EXPECT_FALSE(VtableSlot<BoolFunction>(object, 13)(object));

  using Completion = Tarnik::Http::CustomConnectionSpec::ConnectCompletion;
  using StartFunction = Tarnik::Ref<Tarnik::System::CancellableItem>(const void*, Completion);
  ConnectRecorder recorder;
  const auto item = VtableSlot<StartFunction>(object, 14)(object, recorder.Completion());
  EXPECT_NE(item, nullptr);
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_FALSE(recorder.hasError);
  recorder.lastStream->Close();

  // Slot 4 destroys, slot 5 also frees; a sanitizer detects it if they do not.
  const auto* freed = make(1);
  Tarnik::WeakRef freedWeak;
  freed->AttachWeakRef(freedWeak);
  VtableSlot<VoidFunction>(static_cast<const void*>(freed), 5)(freed);
  EXPECT_EQ(freedWeak.Lock(), nullptr);
  const auto* destroyed = make(1);
  Tarnik::WeakRef destroyedWeak;
  destroyed->AttachWeakRef(destroyedWeak);
  VtableSlot<VoidFunction>(static_cast<const void*>(destroyed), 4)(destroyed);
  EXPECT_EQ(destroyedWeak.Lock(), nullptr);
  ::operator delete(const_cast<void*>(static_cast<const void*>(destroyed)), sizeof(Spec));
}

}  // namespace SsoClient::Testing

#endif
