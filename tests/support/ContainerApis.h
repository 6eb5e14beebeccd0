// The functions of each container by one name, so that a test is written once for all of them:
// GROUP_API(Qlx, StringGroup, Kind) declares QlxStringGroupApi with the public functions, and with
// the prefix qlxIntl one with the twins. Kind is what the test fills it with.
#ifndef QLX_TESTS_CONTAINERAPIS_H
#define QLX_TESTS_CONTAINERAPIS_H

#include <qlx/class/containers.h>

#define GROUP_API(Prefix, Name, Kind)                          \
  struct Prefix##Name##Api {                                   \
    static constexpr char kName[] = #Prefix #Name;             \
    using Twins = struct qlxIntl##Name##Api;                   \
    using Head = Name;                                         \
    using Elements = Kind;                                     \
    static constexpr auto alloc = Prefix##Alloc##Name;         \
    static constexpr auto free = Prefix##Free##Name;           \
    static constexpr auto add = Prefix##Name##Add;             \
    static constexpr auto rem = Prefix##Name##Rem;             \
    static constexpr auto iterator = Prefix##Name##Iterator;   \
    static constexpr auto hasNext = Prefix##Name##IterHasNext; \
    static constexpr auto next = Prefix##Name##IterNext;       \
    static constexpr auto get = Prefix##Name##IterGet;         \
    static constexpr auto iterRem = Prefix##Name##IterRem;     \
    static constexpr auto getLink = Qlx##Name##GetLink;        \
  }

#define LIST_API(Prefix, Name, Kind)                           \
  struct Prefix##Name##Api {                                   \
    static constexpr char kName[] = #Prefix #Name;             \
    using Twins = struct qlxIntl##Name##Api;                   \
    using Elements = Kind;                                     \
    using Head = Name;                                         \
    static constexpr auto alloc = Prefix##Alloc##Name;         \
    static constexpr auto free = Prefix##Free##Name;           \
    static constexpr auto copy = Prefix##Copy##Name;           \
    static constexpr auto append = Prefix##Name##Append;       \
    static constexpr auto sort = QlxSort##Name;                \
    static constexpr auto iterator = Prefix##Name##Iterator;   \
    static constexpr auto hasNext = Prefix##Name##IterHasNext; \
    static constexpr auto next = Prefix##Name##IterNext;       \
    static constexpr auto get = Prefix##Name##IterGet;         \
    static constexpr auto iterRem = Prefix##Name##IterRem;     \
    static constexpr auto getLink = Qlx##Name##GetLink;        \
    static constexpr auto getIndex = Qlx##Name##GetIndex;      \
    static constexpr auto remLink = Qlx##Name##RemLink;        \
  }

#define MAP_API(Prefix, Name, Kind)                            \
  struct Prefix##Name##Api {                                   \
    static constexpr char kName[] = #Prefix #Name;             \
    using Twins = struct qlxIntl##Name##Api;                   \
    using Elements = Kind;                                     \
    using Head = Name;                                         \
    static constexpr auto alloc = Prefix##Alloc##Name;         \
    static constexpr auto free = Prefix##Free##Name;           \
    static constexpr auto copy = Prefix##Copy##Name;           \
    static constexpr auto put = Prefix##Name##Put;             \
    static constexpr auto get = Prefix##Name##Get;             \
    static constexpr auto rem = Prefix##Name##Rem;             \
    static constexpr auto hasKey = Prefix##Name##HasKey;       \
    static constexpr auto iterator = Prefix##Name##Iterator;   \
    static constexpr auto hasNext = Prefix##Name##IterHasNext; \
    static constexpr auto next = Prefix##Name##IterNext;       \
    static constexpr auto getKey = Prefix##Name##IterGetKey;   \
    static constexpr auto getVal = Prefix##Name##IterGetVal;   \
    static constexpr auto getNode = qlxIntl##Name##GetNode;    \
    static constexpr auto remNode = qlxIntl##Name##RemNode;    \
  }

#endif
