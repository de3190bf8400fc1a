#pragma once
// Ring of the last n values of a quantity; element 0 is the newest.

#include <ostream>

#include "LQ_Utils.h"

namespace LQ {

template <class T>
class History {
public:
    History() = default;
    History(const History& other) { *this = other; }
    History& operator=(const History& other) {
        if (this == &other) return *this;
        free();
        if (other.data_) {
            capacity_ = other.capacity_;
            counter_ = other.counter_;
            data_ = new T[capacity_];
            for (unsigned int i = 0; i < capacity_; ++i) data_[i] = other.data_[i];
        }
        return *this;
    }
    ~History() { free(); }

    // Keeps the content when the capacity is unchanged.
    void init(unsigned int capacity) {
        if (data_ && capacity == capacity_) return;
        T* data = new T[capacity];
        free();
        capacity_ = capacity;
        data_ = data;
    }

    // Frees the memory; the next use must call init first.
    void free() {
        delete[] data_;
        data_ = nullptr;
        capacity_ = 0;
        counter_ = 0;
    }

    unsigned int size() const { return capacity_ < counter_ ? capacity_ : counter_; }
    unsigned int capacity() const { return capacity_; }
    unsigned int counter() const { return counter_; }

    void add(const T& value) {
        LQ_ASSERT_MSG(data_, "init not called\n");
        data_[counter_ % capacity_] = value;
        ++counter_;
    }

    // The next slot, still holding what the previous pass of the ring left there.
    T& modifyNext() {
        LQ_ASSERT_MSG(data_, "init not called\n");
        T& slot = data_[counter_ % capacity_];
        ++counter_;
        return slot;
    }

    T& element(unsigned int number) {
        LQ_ASSERT_MSG(data_, "init not called\n");
        LQ_ASSERT_MSG(number < size(), "accessing of element out of range : " << number << " >= " << size());
        return data_[(counter_ - 1 - number) % capacity_];
    }
    const T& element(unsigned int number) const { return const_cast<History*>(this)->element(number); }

private:
    unsigned int capacity_ = 0;
    unsigned int counter_ = 0;
    T* data_ = nullptr;
};

template <class T>
std::ostream& operator<<(std::ostream& stream, const History<T>& history) {
    stream << "History[" << history.size() << "](";
    for (unsigned int i = 0; i < history.size(); ++i) stream << history.element(i) << ", ";
    return stream << ")";
}

}  // namespace LQ
