#include "port/src/resource.h"

#include <cstdlib>

namespace {
// Release(true) ends the process with this status, whatever the anchors held.
const int kReleaseExitStatus = 3;
}  // namespace

PortResourceAnchor_t* PortResourceAnchor_t::current = nullptr;

PortResourceAnchor_t* PortResourceAnchor_t::GetCurrent() {
  return current != nullptr ? current : NewAnchor();
}

PortResourceAnchor_t* PortResourceAnchor_t::NewAnchor() { return new PortResourceAnchor_t(); }

void PortResourceAnchor_t::Release(bool aExit) {
  if (!aExit) {
    delete current;  // its destructor makes the enclosing anchor current
    return;
  }
  while (current != nullptr) delete current;
  std::exit(kReleaseExitStatus);
}

PortResourceAnchor_t::PortResourceAnchor_t()
    : prev(current), next(nullptr), count(0), head(nullptr), tail(nullptr) {
  if (current != nullptr) current->next = this;
  current = this;
}

PortResourceAnchor_t::~PortResourceAnchor_t() {
  delete next;  // inner scopes end first, so the chain unwinds from the innermost outward
  // Each deletion unregisters the resource, making its predecessor the new tail.
  while (tail != nullptr) delete tail;
  current = prev;
  if (prev != nullptr) prev->next = nullptr;
}

void PortResourceAnchor_t::Regist(PortResource_t& aRes) {
  if (head == nullptr) {
    head = &aRes;
  } else {
    tail->next = &aRes;
  }
  aRes.next = nullptr;
  aRes.prev = tail;
  ++count;
  tail = &aRes;
}

void PortResourceAnchor_t::Unregist(PortResource_t& aRes) {
  if (&aRes == head) {
    head = aRes.next;
    if (head != nullptr) head->prev = nullptr;
  } else {
    aRes.prev->next = aRes.next;
  }
  if (&aRes == tail) {
    tail = aRes.prev;
    if (tail != nullptr) tail->next = nullptr;
  } else {
    aRes.next->prev = aRes.prev;
  }
  --count;
}

PortResource_t::PortResource_t() : anchor(PortResourceAnchor_t::GetCurrent()) {
  anchor->Regist(*this);
}

PortResource_t::~PortResource_t() { anchor->Unregist(*this); }
