#include "CxHooks.h"

#include <utility>

// Set before any static of another file is made.
static constinit const CxHooks *gFirst = nullptr;

CxHooks::CxHooks(const CxHookCalls &calls) : calls_(calls), next_(std::exchange(gFirst, this)) {}

void CxHooks::beforeFork() {
  for (const CxHooks *it = gFirst; it; it = it->next_)
    if (it->calls_.beforeFork) it->calls_.beforeFork();
}

void CxHooks::afterFork(bool isChild) {
  for (const CxHooks *it = gFirst; it; it = it->next_)
    if (it->calls_.afterFork) it->calls_.afterFork(isChild);
}

void CxHooks::atClose() {
  for (const CxHooks *it = gFirst; it; it = it->next_)
    if (it->calls_.atClose) it->calls_.atClose();
}
