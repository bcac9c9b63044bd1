#include "tamber/Ref.h"

#include "tamber/Panic.h"

namespace Tamber {

Object::~Object() = default;

void Object::AddRef() const {
  // Taking a reference needs no ordering: the caller already holds one or owns the new object.
  _refCount.fetch_add(1, std::memory_order_relaxed);
}

void Object::Release() const {
  // acq_rel: every write made through other references happens before the deletion.
  const long previous = _refCount.fetch_sub(1, std::memory_order_acq_rel);
  TAMBER_VERIFY(previous > 0);
  if (previous == 1) delete this;
}

}  // namespace Tamber
