// A thread of the system's, which a test cancels.
#ifndef QLX_TESTS_OWNTHREAD_H
#define QLX_TESTS_OWNTHREAD_H

#include <gtest/gtest.h>

#include <functional>
#include <utility>

#include <pthread.h>

class OwnThread {
 public:
  explicit OwnThread(std::function<void()> call) : call_(std::move(call)) {
    EXPECT_EQ(pthread_create(&id_, nullptr, run, this), 0);
  }
  OwnThread(const OwnThread &) = delete;
  OwnThread &operator=(const OwnThread &) = delete;

  void cancel() const { EXPECT_EQ(pthread_cancel(id_), 0); }

  // Waits for its end; whether that came before its call's. To be called once.
  bool endsCancelled() const {
    void *result = nullptr;
    EXPECT_EQ(pthread_join(id_, &result), 0);
    EXPECT_EQ(result, hasReturned_ ? nullptr : PTHREAD_CANCELED);
    return !hasReturned_;
  }

 private:
  static void *run(void *self) {
    static_cast<OwnThread *>(self)->call_();
    static_cast<OwnThread *>(self)->hasReturned_ = true;
    return nullptr;
  }

  std::function<void()> call_;
  bool hasReturned_ = false;  // written before the thread's end, read after it
  pthread_t id_{};
};

// Whether the calling thread may be cancelled.
inline bool isCancellable() {
  int state = -1, ignored = 0;
  pthread_setcancelstate(PTHREAD_CANCEL_DISABLE, &state);
  pthread_setcancelstate(state, &ignored);
  return state == PTHREAD_CANCEL_ENABLE;
}

#endif
