// Two moments that concern each module with state of its own: the process forks, and the toolkit
// closes. A module registers what it has to do then, as a static of its file; who forks or closes
// knows none of them. In which order modules come is not defined.
#ifndef QLX_SRC_CXHOOKS_H
#define QLX_SRC_CXHOOKS_H

struct CxHookCalls {
  void (*beforeFork)() = nullptr;  // each may be null
  void (*afterFork)(bool isChild) = nullptr;
  void (*atClose)() = nullptr;  // frees what is cached; the module may be used again
};

class CxHooks {
 public:
  explicit CxHooks(const CxHookCalls &calls);
  CxHooks(const CxHooks &) = delete;
  CxHooks &operator=(const CxHooks &) = delete;

  static void beforeFork();
  static void afterFork(bool isChild);
  static void atClose();

 private:
  const CxHookCalls calls_;
  const CxHooks *const next_;
};

#endif
