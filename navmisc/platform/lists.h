// Ordered doubly linked lists addressed by POSITION, with the operations the library's code uses:
// CPtrList (pointers, never owned by the list), CStringList and CxStringList (texts).
//
// A POSITION stays valid until its element is removed. Nodes are carved from blocks that grow
// with the list, so appending a million points costs a handful of allocations.
#pragma once

#include <cstddef>
#include <iterator>
#include <memory>
#include <utility>
#include <vector>

#include "navmisc/platform/cstring.h"

struct __POSITION {};
using POSITION = __POSITION*;

namespace navmisc {

template <class T>
class BasicList {
  struct Node {
    Node* prev;
    Node* next;
    T value;
  };

 public:
  explicit BasicList(int /*blockSize*/ = 10) {}
  ~BasicList() { RemoveAll(); }
  BasicList(const BasicList&) = delete;
  BasicList& operator=(const BasicList&) = delete;
  BasicList(BasicList&& other) noexcept { Swap(other); }
  BasicList& operator=(BasicList&& other) noexcept {
    if (this != &other) {
      RemoveAll();
      Swap(other);
    }
    return *this;
  }

  int GetCount() const { return static_cast<int>(count_); }
  int GetSize() const { return static_cast<int>(count_); }
  bool IsEmpty() const { return count_ == 0; }

  POSITION GetHeadPosition() const { return Pos(head_); }
  POSITION GetTailPosition() const { return Pos(tail_); }
  T& GetHead() { return head_->value; }
  const T& GetHead() const { return head_->value; }
  T& GetTail() { return tail_->value; }
  const T& GetTail() const { return tail_->value; }

  // Returns the element at `pos` and moves `pos` to the next one (nullptr at the end).
  T& GetNext(POSITION& pos) {
    Node* n = NodeOf(pos);
    pos = Pos(n->next);
    return n->value;
  }
  const T& GetNext(POSITION& pos) const {
    Node* n = NodeOf(pos);
    pos = Pos(n->next);
    return n->value;
  }
  T& GetPrev(POSITION& pos) {
    Node* n = NodeOf(pos);
    pos = Pos(n->prev);
    return n->value;
  }
  T& GetAt(POSITION pos) { return NodeOf(pos)->value; }
  const T& GetAt(POSITION pos) const { return NodeOf(pos)->value; }
  void SetAt(POSITION pos, T value) { NodeOf(pos)->value = std::move(value); }

  POSITION AddHead(T value) { return InsertBefore(GetHeadPosition(), std::move(value)); }
  POSITION AddTail(T value) { return InsertAfter(GetTailPosition(), std::move(value)); }
  // Appends all elements of `other` (copies of the values).
  void AddTail(const BasicList* other) {
    for (Node* n = other ? other->head_ : nullptr; n; n = n->next) AddTail(n->value);
  }

  // Inserts before `pos`; a null `pos` inserts at the head.
  POSITION InsertBefore(POSITION pos, T value) {
    Node* at = NodeOf(pos);
    Node* n = NewNode(std::move(value));
    if (!at) at = head_;
    if (!at) {
      head_ = tail_ = n;
    } else {
      n->next = at;
      n->prev = at->prev;
      if (at->prev) at->prev->next = n;
      else head_ = n;
      at->prev = n;
    }
    ++count_;
    return Pos(n);
  }
  // Inserts after `pos`; a null `pos` inserts at the tail.
  POSITION InsertAfter(POSITION pos, T value) {
    Node* at = NodeOf(pos);
    Node* n = NewNode(std::move(value));
    if (!at) at = tail_;
    if (!at) {
      head_ = tail_ = n;
    } else {
      n->prev = at;
      n->next = at->next;
      if (at->next) at->next->prev = n;
      else tail_ = n;
      at->next = n;
    }
    ++count_;
    return Pos(n);
  }

  void RemoveAt(POSITION pos) {
    Node* n = NodeOf(pos);
    if (!n) return;
    if (n->prev) n->prev->next = n->next;
    else head_ = n->next;
    if (n->next) n->next->prev = n->prev;
    else tail_ = n->prev;
    FreeNode(n);
    --count_;
  }
  T RemoveHead() {
    T v = std::move(head_->value);
    RemoveAt(Pos(head_));
    return v;
  }
  T RemoveTail() {
    T v = std::move(tail_->value);
    RemoveAt(Pos(tail_));
    return v;
  }
  // Empties the list. Values that are pointers are not deleted: the owner does that.
  void RemoveAll() {
    for (Node* n = head_; n;) {
      Node* next = n->next;
      n->value.~T();
      n = next;
    }
    head_ = tail_ = free_ = nullptr;
    count_ = 0;
    blocks_.clear();
    next_block_ = 16;
  }

  // Position of the first element equal to `value` after `start` (or from the head).
  POSITION Find(const T& value, POSITION start = nullptr) const {
    for (Node* n = start ? NodeOf(start)->next : head_; n; n = n->next)
      if (n->value == value) return Pos(n);
    return nullptr;
  }
  POSITION FindIndex(int index) const {
    if (index < 0) return nullptr;
    Node* n = head_;
    for (; n && index > 0; --index) n = n->next;
    return Pos(n);
  }

  // Range-for support over the values, head to tail.
  template <class V, class N>
  class Iter {
   public:
    using value_type = V;
    using difference_type = std::ptrdiff_t;
    Iter() = default;
    explicit Iter(N* n) : n_(n) {}
    V& operator*() const { return n_->value; }
    Iter& operator++() {
      n_ = n_->next;
      return *this;
    }
    Iter operator++(int) {
      Iter t = *this;
      ++*this;
      return t;
    }
    bool operator==(const Iter& o) const { return n_ == o.n_; }

   private:
    N* n_ = nullptr;
  };
  using iterator = Iter<T, Node>;
  using const_iterator = Iter<const T, Node>;
  iterator begin() { return iterator(head_); }
  iterator end() { return iterator(nullptr); }
  const_iterator begin() const { return const_iterator(head_); }
  const_iterator end() const { return const_iterator(nullptr); }

 private:
  static POSITION Pos(Node* n) { return reinterpret_cast<POSITION>(n); }
  static Node* NodeOf(POSITION p) { return reinterpret_cast<Node*>(p); }

  Node* NewNode(T&& value) {
    if (!free_) Grow();
    Node* n = free_;
    free_ = n->next;
    n->prev = n->next = nullptr;
    new (&n->value) T(std::move(value));
    return n;
  }
  void FreeNode(Node* n) {
    n->value.~T();
    n->next = free_;
    free_ = n;
  }
  void Grow() {
    // Raw storage for a block of nodes; values are constructed in place on use.
    std::unique_ptr<Storage[]> block(new Storage[next_block_]);  // left uninitialised on purpose
    for (size_t i = 0; i < next_block_; ++i) {
      Node* n = reinterpret_cast<Node*>(&block[i]);
      n->next = free_;
      free_ = n;
    }
    blocks_.push_back(std::move(block));
    if (next_block_ < 4096) next_block_ *= 2;
  }
  void Swap(BasicList& o) noexcept {
    std::swap(head_, o.head_);
    std::swap(tail_, o.tail_);
    std::swap(free_, o.free_);
    std::swap(count_, o.count_);
    std::swap(next_block_, o.next_block_);
    blocks_.swap(o.blocks_);
  }

  struct Storage {
    alignas(Node) unsigned char bytes[sizeof(Node)];
  };
  Node* head_ = nullptr;
  Node* tail_ = nullptr;
  Node* free_ = nullptr;
  size_t count_ = 0;
  size_t next_block_ = 16;
  std::vector<std::unique_ptr<Storage[]>> blocks_;
};

}  // namespace navmisc

// A list of pointers. It never deletes what its entries point to: owners do (see DeleteAll).
class CPtrList : public navmisc::BasicList<void*> {
 public:
  using BasicList::BasicList;
};
using CxPtrList = CPtrList;

class CStringList : public navmisc::BasicList<CString> {
 public:
  using BasicList::BasicList;
  POSITION AddTail(const wchar_t* s) { return BasicList::AddTail(CString(s)); }
  POSITION AddTail(CString s) { return BasicList::AddTail(std::move(s)); }
  using BasicList::AddTail;
};

using CxString = CString;

// The suite's string list, with its tokenizer.
class CxStringList : public CStringList {
 public:
  using CStringList::CStringList;
  // Replaces the content with the pieces of `text` between the separator characters in `seps`
  // (empty pieces included, so "a,,b" gives three). Returns the number of pieces.
  int Tokenize(const wchar_t* text, const wchar_t* seps = L",");
};

namespace navmisc {

// Views a CPtrList as a range of T*: `for (auto* p : Items<WAYPOINT_ITEM_INFO>(list))`.
template <class T, class List>
class ItemRange {
 public:
  explicit ItemRange(List& list) : list_(list) {}
  class iterator {
   public:
    using value_type = T*;
    using difference_type = std::ptrdiff_t;
    iterator() = default;
    explicit iterator(decltype(std::declval<List&>().begin()) it) : it_(it) {}
    T* operator*() const { return static_cast<T*>(*it_); }
    iterator& operator++() {
      ++it_;
      return *this;
    }
    iterator operator++(int) {
      iterator t = *this;
      ++it_;
      return t;
    }
    bool operator==(const iterator& o) const { return it_ == o.it_; }

   private:
    decltype(std::declval<List&>().begin()) it_;
  };
  iterator begin() const { return iterator(list_.begin()); }
  iterator end() const { return iterator(list_.end()); }

 private:
  List& list_;
};

template <class T>
ItemRange<T, CPtrList> Items(CPtrList& list) {
  return ItemRange<T, CPtrList>(list);
}
template <class T>
ItemRange<T, const CPtrList> Items(const CPtrList& list) {
  return ItemRange<T, const CPtrList>(list);
}

// Deletes every entry as a T and empties the list: for the lists that own their records.
template <class T>
void DeleteAll(CPtrList& list) {
  for (void* p : list) delete static_cast<T*>(p);
  list.RemoveAll();
}

}  // namespace navmisc
