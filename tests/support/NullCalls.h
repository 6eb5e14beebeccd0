// Null in the place of every pointer: NULLS(function, with(arguments...), answers...) calls the
// function once for each parameter that is a pointer, null there and the given argument everywhere
// else, and hands the result to that parameter's answer. One answer alone serves all places. HELD
// holds the API lock during each call, as a class operation does.
#ifndef QLX_TESTS_NULLCALLS_H
#define QLX_TESTS_NULLCALLS_H

#include <gtest/gtest.h>

#include <array>
#include <functional>
#include <optional>
#include <ostream>
#include <set>
#include <string>
#include <tuple>
#include <type_traits>
#include <utility>
#include <vector>

#include "object/QlxLocked.h"
#include "support/Status.h"
#include "support/Take.h"

// A group of calls, one for each subsystem; NULL_GROUP(Name) { ... } makes one known to the tests.
struct NullGroup {
  NullGroup(const char *groupName, void (*groupCalls)()) : name(groupName), calls(groupCalls) {
    all().push_back(*this);
  }
  static std::vector<NullGroup> &all() {
    static std::vector<NullGroup> groups;
    return groups;
  }
  // The names of the functions that were called since the process began.
  static std::set<std::string> &called() {
    static std::set<std::string> names;
    return names;
  }
  friend void PrintTo(const NullGroup &group, std::ostream *out) { *out << group.name; }

  const char *name;
  void (*calls)();
};

#define NULL_GROUP(Name)                                  \
  static void nulls##Name();                              \
  static const NullGroup group##Name(#Name, nulls##Name); \
  static void nulls##Name()

// ---- Answers

inline constexpr auto nothing = [](auto...) {};

// 0, 0.0 or null.
inline constexpr auto isZero = [](auto result) { EXPECT_EQ(result, decltype(result){}); };

template <typename T>
auto is(T expected) {
  return [=](auto result) { EXPECT_EQ(result, expected); };
}

inline auto fails(int32_t error) {
  return is(failure(error));
}

inline auto givesText(std::string expected) {
  return [=](char *result) { EXPECT_EQ(take(result), expected); };
}

inline auto givesText(std::u16string expected) {
  return [=](UChar *result) { EXPECT_EQ(take(result), expected); };
}

// A typed reader's answer for an absent value: zero or null, and `found` becomes 0.
struct Absent {
  template <typename T>
  void operator()(T result) const {
    EXPECT_EQ(result, T{});
    EXPECT_EQ(found, 0);
    found = 7;
  }
  uint8_t &found;
};

// ---- Calls

// A started argument list is a pointer on some platforms; null is none on any.
std::true_type isStartedList(std::decay_t<va_list> *);
std::false_type isStartedList(const volatile void *);

template <typename T>
inline constexpr bool kNullable =
    std::is_pointer_v<T> && !decltype(isStartedList(static_cast<T *>(nullptr)))::value;

template <typename... Args>
std::tuple<Args...> with(Args... args) {
  return {args...};
}

template <typename Function, typename R, typename... P>
class NullCalls {
 public:
  NullCalls(const char *name, Function function, bool held, std::tuple<P...> valid)
      : name_(name), function_(function), held_(held), valid_(valid) {}

  template <typename... Answers>
  void run(Answers... answers) {
    constexpr size_t places = (size_t{0} + ... + kNullable<P>);
    static_assert(places > 0, "no parameter can be null");
    static_assert(sizeof...(Answers) == 1 || sizeof...(Answers) == places,
                  "one answer for all pointers, or one for each");
    const std::array<Answer, sizeof...(Answers)> each{Answer(answers)...};
    NullGroup::called().insert(name_);
    forEachPointer([&, next = size_t{0}]<size_t index>() mutable {
      SCOPED_TRACE(std::string(name_) + ", null as argument " + std::to_string(index + 1));
      auto args = valid_;
      std::get<index>(args) = nullptr;
      call(args, each[each.size() == 1 ? 0 : next++]);
    });
  }

 private:
  using Answer =
      std::conditional_t<std::is_void_v<R>, std::function<void()>,
                         std::function<void(std::conditional_t<std::is_void_v<R>, int, R>)>>;

  template <typename Visit>
  static void forEachPointer(Visit visit) {
    [&]<size_t... index>(std::index_sequence<index...>) {
      (visitOne<index, P>(visit), ...);
    }
    (std::index_sequence_for<P...>{});
  }

  template <size_t index, typename Parameter, typename Visit>
  static void visitOne(Visit &visit) {
    if constexpr (kNullable<Parameter>) visit.template operator()<index>();
  }

  void call(const std::tuple<P...> &args, const Answer &answer) {
    std::optional<ApiLock> lock;
    if (held_) lock.emplace();
    if constexpr (std::is_void_v<R>) {
      std::apply(function_, args);
      lock.reset();
      answer();
    } else {
      const R result = std::apply(function_, args);
      lock.reset();
      answer(result);
    }
  }

  const char *name_;
  Function function_;
  bool held_;
  std::tuple<P...> valid_;
};

template <typename... P, typename... Args, size_t... index>
std::tuple<P...> convert(const std::tuple<Args...> &args, std::index_sequence<index...>) {
  static_assert(sizeof...(P) == sizeof...(Args), "an argument for each parameter");
  return {static_cast<P>(std::get<index>(args))...};
}

template <typename R, typename... P, typename... Args, typename... Answers>
void eachNull(const char *name, bool held, R (*function)(P...), const std::tuple<Args...> &args,
              Answers... answers) {
  NullCalls<R (*)(P...), R, P...>(name, function, held,
                                  convert<P...>(args, std::index_sequence_for<Args...>{}))
      .run(answers...);
}

template <typename R, typename... P, typename... Args, typename... Answers>
void eachNull(const char *name, bool held, R (*function)(P..., ...),
              const std::tuple<Args...> &args, Answers... answers) {
  NullCalls<R (*)(P..., ...), R, P...>(name, function, held,
                                       convert<P...>(args, std::index_sequence_for<Args...>{}))
      .run(answers...);
}

#define NULLS(function, ...) eachNull(#function, false, function, __VA_ARGS__)
#define HELD(function, ...) eachNull(#function, true, function, __VA_ARGS__)

// A public function and its twin.
#define NULLS_OF_BOTH(Name, ...) \
  NULLS(Qlx##Name, __VA_ARGS__); \
  HELD(qlxIntl##Name, __VA_ARGS__)

// The reader of a property: `holder` has the property "key", and `found` is the caller's byte.
#define NULLS_OF_GETTER(Calls, function, holder, answer) \
  Calls(function, with(holder, "key", &found), Absent{found}, Absent{found}, answer)

#endif
