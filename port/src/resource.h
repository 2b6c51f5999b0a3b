// Resource anchors: every PortResource_t registers with the innermost anchor when it is
// made and unregisters when it is destroyed. Releasing an anchor deletes the resources still
// registered with it, newest first, after releasing the anchors opened inside it.
// Anchors form a stack whose top is PortResourceAnchor_t::current.
#ifndef PORT_RESOURCE_H
#define PORT_RESOURCE_H

#include "port/src/string.h"

class PortResource_t;

class PortResourceAnchor_t {
 public:
  static PortResourceAnchor_t* GetCurrent();  // creates the root anchor when none exists
  static PortResourceAnchor_t* NewAnchor();   // opens a nested scope, which becomes current
  // Closes the innermost anchor; with aExit, closes every anchor and ends the process
  // with exit status 3.
  static void Release(bool aExit);
  int GetCount() const { return count; }

 private:
  friend class PortResource_t;
  friend struct PortResourceInspector_t;  // test-only view of the stack and the lists
  PortResourceAnchor_t();
  ~PortResourceAnchor_t();
  PortResourceAnchor_t(const PortResourceAnchor_t&) = delete;
  PortResourceAnchor_t& operator=(const PortResourceAnchor_t&) = delete;
  void Regist(PortResource_t& aRes);
  void Unregist(PortResource_t& aRes);

  PortResourceAnchor_t* prev;
  PortResourceAnchor_t* next;
  PORT_s32_t count;
  PortResource_t* head;
  PortResource_t* tail;
  static PortResourceAnchor_t* current;
};

// Base of every owned resource; one that may outlive its scope must be a heap object,
// since releasing the anchor deletes it.
class PortResource_t {
 public:
  PortResource_t();
  virtual ~PortResource_t();
  PortResource_t(const PortResource_t&) = delete;
  PortResource_t& operator=(const PortResource_t&) = delete;

 private:
  friend class PortResourceAnchor_t;
  friend struct PortResourceInspector_t;
  PortResourceAnchor_t* anchor;
  PortResource_t* prev;
  PortResource_t* next;
};

#endif
