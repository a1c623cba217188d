// FIFO of untyped pointers for hand-over between threads. The queue never looks at its items and
// never frees them. It has no size limit and wakes nobody: waiting for items is the semaphores' part.
//
// Not self-locking: every producer and consumer brackets its operations with lock() and unlock() (a
// queue that only one thread knows needs neither).
#pragma once

#include <pthread.h>
#include <stddef.h>

#include "omxbridge/export.h"

// One link. Destroying a node destroys the nodes behind it: null its `next` before taking it out.
class OMXBRIDGE_EXPORT SimpleNode {
 public:
  explicit SimpleNode(void* item);
  ~SimpleNode();
  SimpleNode(const SimpleNode&) = delete;
  SimpleNode& operator=(const SimpleNode&) = delete;

  void* getData() const;
  SimpleNode* getNext() const;
  void setNext(SimpleNode* node);

 private:
  void* data;        // not owned
  SimpleNode* next;  // owned
};

class OMXBRIDGE_EXPORT SimpleQueue {
 public:
  SimpleQueue();
  // Frees the nodes, leaves the items to their owners.
  ~SimpleQueue();
  SimpleQueue(const SimpleQueue&) = delete;
  SimpleQueue& operator=(const SimpleQueue&) = delete;

  // Appends an item. One node is allocated; where that fails the item is not in the queue and
  // false comes back.
  bool add(void* item);
  // Takes the oldest item; null when there is none.
  void* dequeue();
  bool isEmpty() const;
  bool contains(const void* item) const;
  // Counts the items, one by one.
  size_t size() const {
    size_t count = 0;
    for (const SimpleNode* node = head; node != nullptr; node = node->getNext()) ++count;
    return count;
  }

  void lock();
  void unlock();

 private:
  SimpleNode* head;
  SimpleNode* tail;
  pthread_mutex_t mutex;
};
