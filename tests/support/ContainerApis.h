// The functions of each container by one name, so that a test is written once for all of them:
// QlxStringGroupApi has the public functions, qlxIntlStringGroupApi the twins. What is public
// alone, or a twin alone, both have.
#ifndef QLX_TESTS_CONTAINERAPIS_H
#define QLX_TESTS_CONTAINERAPIS_H

#include <qlx/class/containers.h>

#define CONTAINER_API(Prefix, Name)                          \
  static constexpr char kName[] = #Prefix #Name;             \
  using Twins = struct qlxIntl##Name##Api;                   \
  using Head = Name;                                         \
  static constexpr auto alloc = Prefix##Alloc##Name;         \
  static constexpr auto free = Prefix##Free##Name;           \
  static constexpr auto iterator = Prefix##Name##Iterator;   \
  static constexpr auto hasNext = Prefix##Name##IterHasNext; \
  static constexpr auto next = Prefix##Name##IterNext

#define GROUP_API(Prefix, Name)                            \
  struct Prefix##Name##Api {                               \
    CONTAINER_API(Prefix, Name);                           \
    static constexpr auto add = Prefix##Name##Add;         \
    static constexpr auto rem = Prefix##Name##Rem;         \
    static constexpr auto get = Prefix##Name##IterGet;     \
    static constexpr auto iterRem = Prefix##Name##IterRem; \
    static constexpr auto getLink = Qlx##Name##GetLink;    \
  }

#define LIST_API(Prefix, Name)                             \
  struct Prefix##Name##Api {                               \
    CONTAINER_API(Prefix, Name);                           \
    static constexpr auto copy = Prefix##Copy##Name;       \
    static constexpr auto append = Prefix##Name##Append;   \
    static constexpr auto sort = QlxSort##Name;            \
    static constexpr auto get = Prefix##Name##IterGet;     \
    static constexpr auto iterRem = Prefix##Name##IterRem; \
    static constexpr auto getLink = Qlx##Name##GetLink;    \
    static constexpr auto getIndex = Qlx##Name##GetIndex;  \
    static constexpr auto remLink = Qlx##Name##RemLink;    \
  }

#define MAP_API(Prefix, Name)                                \
  struct Prefix##Name##Api {                                 \
    CONTAINER_API(Prefix, Name);                             \
    static constexpr auto copy = Prefix##Copy##Name;         \
    static constexpr auto put = Prefix##Name##Put;           \
    static constexpr auto get = Prefix##Name##Get;           \
    static constexpr auto rem = Prefix##Name##Rem;           \
    static constexpr auto hasKey = Prefix##Name##HasKey;     \
    static constexpr auto getKey = Prefix##Name##IterGetKey; \
    static constexpr auto getVal = Prefix##Name##IterGetVal; \
    static constexpr auto getNode = qlxIntl##Name##GetNode;  \
    static constexpr auto remNode = qlxIntl##Name##RemNode;  \
  }

GROUP_API(qlxIntl, StringGroup);
GROUP_API(qlxIntl, ListenerGroup);
LIST_API(qlxIntl, StringList);
LIST_API(qlxIntl, ParmList);
MAP_API(qlxIntl, StringToStringMap);
MAP_API(qlxIntl, StringToObjMap);
MAP_API(qlxIntl, StringToObjCfgMap);
MAP_API(qlxIntl, StringToObjClassMap);

GROUP_API(Qlx, StringGroup);
GROUP_API(Qlx, ListenerGroup);
LIST_API(Qlx, StringList);
LIST_API(Qlx, ParmList);
MAP_API(Qlx, StringToStringMap);
MAP_API(Qlx, StringToObjMap);
MAP_API(Qlx, StringToObjCfgMap);
MAP_API(Qlx, StringToObjClassMap);

#undef CONTAINER_API
#undef GROUP_API
#undef LIST_API
#undef MAP_API

template <typename Api>
using ValueOf = decltype(Api::Head::head->value);

// Maps have keys, groups and lists do not.
template <typename Api>
constexpr bool kHasKeys = requires {
  Api::hasKey;
};

#endif
