#include "core/simple_queue.h"

#include <memory>
#include <new>

SimpleNode::SimpleNode(void* item) : data(item), next(nullptr) {}

SimpleNode::~SimpleNode() {
  delete next;
}

void* SimpleNode::getData() const {
  return data;
}

SimpleNode* SimpleNode::getNext() const {
  return next;
}

void SimpleNode::setNext(SimpleNode* node) {
  next = node;
}

SimpleQueue::SimpleQueue() : head(nullptr), tail(nullptr) {
  pthread_mutex_init(&mutex, nullptr);
}

SimpleQueue::~SimpleQueue() {
  lock();
  // Node by node: freeing the chain from its head would recurse once per node.
  while (!isEmpty()) dequeue();
  unlock();
  pthread_mutex_destroy(&mutex);
}

bool SimpleQueue::add(void* item) {
  auto* node = new (std::nothrow) SimpleNode(item);
  if (node == nullptr) return false;
  if (tail != nullptr) tail->setNext(node);
  tail = node;
  if (head == nullptr) head = node;
  return true;
}

void* SimpleQueue::dequeue() {
  const std::unique_ptr<SimpleNode> node(head);
  if (node == nullptr) return nullptr;
  head = node->getNext();
  if (head == nullptr) tail = nullptr;
  node->setNext(nullptr);
  return node->getData();
}

bool SimpleQueue::isEmpty() const {
  return head == nullptr;
}

bool SimpleQueue::contains(const void* item) const {
  for (const SimpleNode* node = head; node != nullptr; node = node->getNext()) {
    if (node->getData() == item) return true;
  }
  return false;
}

void SimpleQueue::lock() {
  pthread_mutex_lock(&mutex);
}

void SimpleQueue::unlock() {
  pthread_mutex_unlock(&mutex);
}
