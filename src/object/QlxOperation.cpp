// The library's only source that is compiled with exceptions.
#include "QlxOperation.h"

#include <cstdio>
#include <cstdlib>

#include <cxxabi.h>

#include "record/QlxLoggedEvent.h"

[[noreturn]] static void end(const char *what, QlxOperationName name) {
  const char *className = name.objClass->name;
  std::fprintf(stderr, "qlx: %s left the operation %s of the class %s\n", what, name.operation,
               className ? className : "");
  std::abort();
}

template <typename Result, typename... Args>
Result qlxCallHosts(QlxOperationName name, Result (*operation)(Args...),
                    std::type_identity_t<Args>... args) noexcept {
  qlxSettleNotedEvent();
  try {
    return operation(args...);
  } catch (abi::__forced_unwind &) {
    end("the end of a thread", name);
  } catch (...) {
    end("an exception", name);
  }
}

#define QLX_SIGNATURE(Result, ...) \
  template Result qlxCallHosts(QlxOperationName, Result (*)(__VA_ARGS__), ##__VA_ARGS__) noexcept;

// fAllocVars, fFreeVars, fCfgChange
template void *qlxCallHosts(QlxOperationName, void *(*)()) noexcept;
QLX_SIGNATURE(void, void *)
QLX_SIGNATURE(void, QlxObject *, const char *)
// fLog and fProcess, fIsLoggable, fFormat
QLX_SIGNATURE(void, QlxObject *, Event *, va_list *)
QLX_SIGNATURE(uint8_t, QlxObject *, Event *, va_list *)
QLX_SIGNATURE(UChar *, QlxObject *, Event *, va_list *)
// fClose, fGetHeader and fGetTrailer, fBindMsg
QLX_SIGNATURE(void, QlxObject *)
QLX_SIGNATURE(char *, QlxObject *)
QLX_SIGNATURE(UChar *, I18Msg *, va_list *)

#undef QLX_SIGNATURE
