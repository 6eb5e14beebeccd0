#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <memory>
#include <string>

#include <qlx/memory.h>
#include <qlx/props.h>

#include "support/FailingMemory.h"

namespace {

struct FreeParm {
  void operator()(Parm *parm) const { QlxFreeParm(parm); }
};
using OwnedParm = std::unique_ptr<Parm, FreeParm>;

Parm make(int32_t type, int64_t slot) {
  Parm parm{};
  parm.type = type;
  parm.value.l = slot;
  return parm;
}

Parm makeString(char *text) {
  Parm parm{};
  parm.type = ParmString;
  parm.value.s = text;
  return parm;
}

Parm makeFloat64(double value) {
  Parm parm{};
  parm.type = ParmFloat64;
  parm.value.d = value;
  return parm;
}

Parm makeFloat32(float value) {
  Parm parm{};
  parm.type = ParmFloat32;
  parm.value.f = value;
  return parm;
}

OwnedParm copyOf(const Parm &parm) {
  return OwnedParm{QlxCopyParm(&parm)};
}

TEST(QlxParmTest, ACopyEqualsItsSourceForEveryType) {
  char text[] = "text";
  for (const Parm &parm :
       {make(ParmByte, 'b'), make(ParmInt32, -5), make(ParmInt64, 77), makeFloat32(0.1F),
        makeFloat64(0.1), make(ParmChar, 'c'), makeString(text)}) {
    const OwnedParm copy = copyOf(parm);
    ASSERT_NE(copy, nullptr);
    EXPECT_EQ(copy->type, parm.type);
    EXPECT_EQ(QlxCmpParms(copy.get(), &parm), 1) << parm.type;
    EXPECT_EQ(QlxCmpParms(&parm, copy.get()), 1) << parm.type;
  }
}

TEST(QlxParmTest, ACopiedStringIsIndependent) {
  char text[] = "text";
  const Parm parm = makeString(text);
  const OwnedParm copy = copyOf(parm);
  EXPECT_NE(copy->value.s, text);
  EXPECT_EQ(QlxCmpParms(copy.get(), &parm), 1);
  text[0] = 'n';
  EXPECT_STREQ(copy->value.s, "text");
  EXPECT_EQ(QlxCmpParms(copy.get(), &parm), 0);
}

TEST(QlxParmTest, OfA64BitIntegerOnlyTheLowWordIsCopied) {
  EXPECT_EQ(copyOf(make(ParmInt64, 0x700000005))->value.l, 5);
  EXPECT_EQ(copyOf(make(ParmInt64, -1))->value.l, 0xFFFFFFFF);
}

TEST(QlxParmTest, Of64BitIntegersOnlyTheLowWordsAreCompared) {
  const Parm five = make(ParmInt64, 5);
  const Parm alike = make(ParmInt64, 0x700000005);
  const Parm other = make(ParmInt64, 0x700000006);
  EXPECT_EQ(QlxCmpParms(&five, &alike), 1);
  EXPECT_EQ(QlxCmpParms(&alike, &other), 0);
}

TEST(QlxParmTest, OfACharacterOnlyTheByteIsCompared) {
  for (const int32_t type : {ParmByte, ParmChar}) {
    const Parm a = make(type, 0x4100 + 'x'), b = make(type, 'x'), c = make(type, 'y');
    EXPECT_EQ(QlxCmpParms(&a, &b), 1);
    EXPECT_EQ(QlxCmpParms(&b, &c), 0);
  }
}

TEST(QlxParmTest, DifferentTypesAreUnequal) {
  const Parm a = make(ParmInt32, 5), b = make(ParmInt64, 5);
  EXPECT_EQ(QlxCmpParms(&a, &b), 0);
}

TEST(QlxParmTest, DifferentValuesAreUnequal) {
  const Parm a = make(ParmInt32, 5), b = make(ParmInt32, 6);
  EXPECT_EQ(QlxCmpParms(&a, &b), 0);
  const Parm c = makeFloat64(1.0), d = makeFloat64(1.0 + 1e-15);
  EXPECT_EQ(QlxCmpParms(&c, &d), 0);
  const Parm e = makeFloat32(1.0F), f = makeFloat32(1.5F);
  EXPECT_EQ(QlxCmpParms(&e, &f), 0);
  char lower[] = "a", upper[] = "A";
  const Parm g = makeString(lower), h = makeString(upper);
  EXPECT_EQ(QlxCmpParms(&g, &h), 0);
}

TEST(QlxParmTest, NotANumberEqualsNothingButZerosOfBothSignsAreEqual) {
  const Parm nan64 = makeFloat64(std::nan("")), nan32 = makeFloat32(std::nanf(""));
  EXPECT_EQ(QlxCmpParms(&nan64, &nan64), 0);
  EXPECT_EQ(QlxCmpParms(&nan32, &nan32), 0);
  const Parm zero = makeFloat64(0.0), minusZero = makeFloat64(-0.0);
  EXPECT_EQ(QlxCmpParms(&zero, &minusZero), 1);
}

TEST(QlxParmTest, TwoNullsAreEqualAndOneIsNot) {
  const Parm parm = make(ParmInt32, 0);
  EXPECT_EQ(QlxCmpParms(nullptr, nullptr), 1);
  EXPECT_EQ(QlxCmpParms(&parm, nullptr), 0);
  EXPECT_EQ(QlxCmpParms(nullptr, &parm), 0);
}

TEST(QlxParmTest, UnknownTypesAreUnequalAndCopiedWithoutTheirValue) {
  for (const int32_t type : {0, 500, 508}) {
    const Parm parm = make(type, 5);
    EXPECT_EQ(QlxCmpParms(&parm, &parm), 0);
    const OwnedParm copy = copyOf(parm);
    EXPECT_EQ(copy->type, type);
    EXPECT_EQ(copy->value.l, 0);
  }
}

TEST(QlxParmTest, ANullStringIsCopiedAndEqualsNothing) {
  const Parm parm = makeString(nullptr);
  const OwnedParm copy = copyOf(parm);
  ASSERT_NE(copy, nullptr);
  EXPECT_EQ(copy->value.s, nullptr);
  EXPECT_EQ(QlxCmpParms(&parm, copy.get()), 0);
}

TEST(QlxParmTest, NullIsNotCopiedAndFreeingItDoesNothing) {
  EXPECT_EQ(QlxCopyParm(nullptr), nullptr);
  QlxFreeParm(nullptr);
}

TEST(QlxParmTest, ACopyWithoutMemoryIsNullAndLosesNothing) {
  char text[] = "text";
  const Parm parm = makeString(text);
  FailingMemory memory;
  for (uint64_t nth = 1; nth <= 2; ++nth) {
    memory.failOnce(nth);
    EXPECT_EQ(QlxCopyParm(&parm), nullptr);
  }
  memory.failNone();
  QlxFreeParm(QlxCopyParm(&parm));
  EXPECT_EQ(memory.attempts(), 2u);
  EXPECT_EQ(memory.live(), 0);
}

}  // namespace
