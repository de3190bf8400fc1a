#pragma once
// Reference-counted holders: the only form of shared ownership in the library.
//
// Holders that own nothing (empty ones, and those over foreign memory) all count on
// one static counter per instantiation that starts at 1 and so never reaches 0:
// they cost no allocation and never delete.

#include <atomic>
#include <cstddef>
#include <ostream>

namespace LQ {

template <class T>
struct DefaultPtrDeleter {
    void operator()(T* pointer) const { delete pointer; }
};

template <class T>
struct DefaultArrayDeleter {
    void operator()(T* pointer) const { delete[] pointer; }
};

template <class T, class Deleter>
class SharedPtrBase {
public:
    using Counter = std::atomic<int>;

    SharedPtrBase() : pointer_(nullptr), counter_(&staticCounter_) { acquire(); }
    explicit SharedPtrBase(T* pointer) : pointer_(nullptr), counter_(nullptr) { reset(pointer); }
    // A holder over memory that somebody else owns.
    SharedPtrBase(T* pointer, bool owning) : pointer_(nullptr), counter_(nullptr) {
        if (owning) {
            reset(pointer);
        } else {
            pointer_ = pointer;
            counter_ = &staticCounter_;
            acquire();
        }
    }
    SharedPtrBase(const SharedPtrBase& other) : pointer_(other.pointer_), counter_(other.counter_) { acquire(); }
    ~SharedPtrBase() { release(); }

    SharedPtrBase& operator=(const SharedPtrBase& other) {
        if (this == &other) return *this;
        release();
        pointer_ = other.pointer_;
        counter_ = other.counter_;
        acquire();
        return *this;
    }

    T* get() const { return pointer_; }
    explicit operator bool() const { return pointer_ != nullptr; }
    bool operator==(std::nullptr_t) const { return pointer_ == nullptr; }
    bool operator!=(std::nullptr_t) const { return pointer_ != nullptr; }
    bool operator==(const SharedPtrBase& other) const { return pointer_ == other.pointer_; }
    bool operator!=(const SharedPtrBase& other) const { return pointer_ != other.pointer_; }

    // How many holders share this counter (for the static counter: one more than them).
    int useCount() const { return counter_ ? counter_->load() : 0; }
    bool isOwning() const { return counter_ != &staticCounter_; }

    static Counter staticCounter_;

protected:
    template <class, class>
    friend class SharedPtrBase;

    // Takes ownership of pointer. The counter is made first, so a failed allocation
    // leaves the holder as it was.
    void reset(T* pointer) {
        Counter* counter = new Counter(1);
        release();
        pointer_ = pointer;
        counter_ = counter;
    }

    void acquire() { counter_->fetch_add(1, std::memory_order_relaxed); }

    void release() {
        // the static counter starts at 1 and never reaches 0; the test only tells the compiler so
        if (counter_ && counter_->fetch_sub(1, std::memory_order_acq_rel) == 1 && counter_ != &staticCounter_) {
            if (pointer_) Deleter()(pointer_);
            delete counter_;
        }
        pointer_ = nullptr;
        counter_ = nullptr;
    }

    // Shares another instantiation's object and counter (derived to base).
    template <class U, class D>
    void shareFrom(const SharedPtrBase<U, D>& other) {
        release();
        pointer_ = other.pointer_;
        counter_ = other.isOwning() ? other.counter_ : &staticCounter_;
        acquire();
    }

    T* pointer_;
    Counter* counter_;
};

template <class T, class Deleter>
typename SharedPtrBase<T, Deleter>::Counter SharedPtrBase<T, Deleter>::staticCounter_(1);

template <class T>
class SharedPtr : public SharedPtrBase<T, DefaultPtrDeleter<T>> {
    using Base = SharedPtrBase<T, DefaultPtrDeleter<T>>;

public:
    SharedPtr() = default;
    SharedPtr(std::nullptr_t) {}
    SharedPtr(T* pointer) : Base(pointer) {}
    SharedPtr(T* pointer, bool owning) : Base(pointer, owning) {}
    SharedPtr(const SharedPtr& other) = default;
    // A holder of a derived object shares it as its base; the virtual destructor deletes it.
    template <class U>
    SharedPtr(const SharedPtr<U>& other) {
        this->shareFrom(other);
    }

    SharedPtr& operator=(const SharedPtr& other) = default;
    SharedPtr& operator=(T* pointer) {
        this->reset(pointer);
        return *this;
    }
    template <class U>
    SharedPtr& operator=(const SharedPtr<U>& other) {
        this->shareFrom(other);
        return *this;
    }

    T* operator->() const { return this->pointer_; }
    T& operator*() const { return *this->pointer_; }
};

template <class T>
class SharedArray : public SharedPtrBase<T, DefaultArrayDeleter<T>> {
    using Base = SharedPtrBase<T, DefaultArrayDeleter<T>>;

public:
    SharedArray() = default;
    SharedArray(std::nullptr_t) {}
    SharedArray(T* pointer) : Base(pointer) {}
    SharedArray(T* pointer, bool owning) : Base(pointer, owning) {}
    SharedArray(const SharedArray& other) = default;

    SharedArray& operator=(const SharedArray& other) = default;
    SharedArray& operator=(T* pointer) {
        this->reset(pointer);
        return *this;
    }

    T& operator[](std::ptrdiff_t index) const { return this->pointer_[index]; }
};

// Holders of related types are equal when they hold the same object.
template <class T, class U>
bool operator==(const SharedPtr<T>& a, const SharedPtr<U>& b) {
    return a.get() == b.get();
}

template <class T>
std::ostream& operator<<(std::ostream& stream, const SharedPtr<T>& pointer) {
    stream << "SharedPtr(";
    if (pointer)
        stream << *pointer;
    else
        stream << "NULL";
    return stream << ")";
}

}  // namespace LQ
