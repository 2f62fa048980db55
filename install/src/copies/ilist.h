// The framework's own doubly linked list, which owns its elements. Its cursor survives the removal of the element that
// it is on.
#pragma once

#include <cstdint>
#include <cstdlib>

namespace kz7 {

// One node. It owns its element and deletes it through the element's virtual destructor.
template <typename T>
struct INODE {
    explicit INODE(T* element) : data(element) {}
    // Deliberate: a copy shares the element, and the node that is destroyed first deletes it; callers never destroy
    // both.
    INODE(const INODE&) = delete;
    INODE& operator=(const INODE& other) = default;
    ~INODE() { delete data; }

    T* data;
    INODE* next = nullptr;
    INODE* prev = nullptr;
};

// A character buffer from malloc().
template <>
inline INODE<char>::~INODE() {
    std::free(data);
}

template <typename T>
class ILIST {
public:
    ILIST() = default;
    ILIST(const ILIST&) = delete;
    ILIST& operator=(const ILIST&) = delete;

    // Removes every element, front first.
    virtual ~ILIST() {
        for (cursor_ = head_; cursor_ != nullptr; step()) {
            remove(cursor_->data);
        }
    }

    // Appends an element and takes ownership. The cursor moves to the first element of an empty list.
    void append(T* element) {
        auto* node = new INODE<T>(element);
        if (tail_ == nullptr) {
            head_ = cursor_ = node;
        } else {
            tail_->next = node;
            node->prev = tail_;
        }
        tail_ = node;
        ++count_;
    }

    // Destroys the element; does nothing if no node holds it. The next step of a walk goes to the element that followed
    // it.
    void remove(const T* element) {
        for (INODE<T>* node = head_; node != nullptr; node = node->next) {
            if (node->data == element) {
                unlink(node);
                return;
            }
        }
    }

    // Walks the list; null past the last element.
    T* first() {
        cursor_ = head_;
        return current();
    }
    T* next() {
        step();
        return current();
    }

    std::uint32_t count() const { return count_; }

protected:
    // Preserve the cursor of the caller's walk during a search.
    void saveCursor() { savedCursor_ = cursor_; }
    void restoreCursor() { cursor_ = savedCursor_; }

private:
    T* current() const { return cursor_ == nullptr ? nullptr : cursor_->data; }

    void step() { cursor_ = cursor_ == nullptr ? head_ : cursor_->next; }

    void unlink(INODE<T>* node) {
        if (node == tail_) {
            tail_ = node->prev;
        }
        if (node == cursor_) {
            cursor_ = node->prev;
        }
        (node->prev == nullptr ? head_ : node->prev->next) = node->next;
        if (node->next != nullptr) {
            node->next->prev = node->prev;
        }
        delete node;
        --count_;
    }

    INODE<T>* head_ = nullptr;
    INODE<T>* cursor_ = nullptr;
    INODE<T>* tail_ = nullptr;
    INODE<T>* savedCursor_ = nullptr;
    std::uint32_t count_ = 0;
};

}  // namespace kz7
