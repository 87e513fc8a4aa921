// The one reference-count word and the one intrusive pointer behind every counted object
// and smart pointer of the library, internal and public alike.
#pragma once

#include <atomic>
#include <utility>

namespace ZYRStd::detail {

// Every count operation of the library, on an atomic word or a bare one seen through
// std::atomic_ref. The memory orders, once for all of them:
// - an increment is relaxed: a new reference is taken from one already held, so the object
//   is alive and nothing needs ordering;
// - a decrement is acquire-release: release publishes this owner's writes, and acquire on
//   the one that reaches 0 makes every owner's writes visible to the destructor;
// - a read is acquire, so that "not shared" lets the reader act on what others wrote.
struct RefCountOps {
    template <class Word> static void increment(Word& word) noexcept {
        word.fetch_add(1, std::memory_order_relaxed);
    }
    // Returns the new count.
    template <class Word> static unsigned int decrement(Word& word) noexcept {
        return word.fetch_sub(1, std::memory_order_acq_rel) - 1;
    }
    template <class Word> static unsigned int value(const Word& word) noexcept {
        return word.load(std::memory_order_acquire);
    }
};

// A count that starts at 1, for its creator. Copies carry the count word over unchanged, as
// a memberwise copy would.
class RefCountWord {
public:
    RefCountWord() noexcept = default;
    RefCountWord(const RefCountWord& other) noexcept
        : word_(other.word_.load(std::memory_order_relaxed)) {}
    RefCountWord& operator=(const RefCountWord& other) noexcept {
        word_.store(other.word_.load(std::memory_order_relaxed), std::memory_order_relaxed);
        return *this;
    }

    void increment() const noexcept { RefCountOps::increment(word_); }
    unsigned int decrement() const noexcept { return RefCountOps::decrement(word_); }
    unsigned int value() const noexcept { return RefCountOps::value(word_); }
    const unsigned int* address() const noexcept {
        static_assert(sizeof(std::atomic<unsigned int>) == sizeof(unsigned int));
        return reinterpret_cast<const unsigned int*>(&word_);
    }

private:
    mutable std::atomic<unsigned int> word_{1};
};

// Holds one reference to an object with addRef() and release(); the object deletes itself
// on its last release.
template <class T> class IntrusivePtr {
public:
    IntrusivePtr() noexcept = default;
    // `addRef` false adopts the reference the caller already holds.
    IntrusivePtr(T* p, bool addRef) noexcept : p_(p) {
        if (p_ && addRef)
            p_->addRef();
    }
    IntrusivePtr(const IntrusivePtr& other) noexcept : IntrusivePtr(other.p_, true) {}
    IntrusivePtr(IntrusivePtr&& other) noexcept : p_(std::exchange(other.p_, nullptr)) {}
    IntrusivePtr& operator=(const IntrusivePtr& other) noexcept {
        // The new object gains its reference before the old one may be deleted, so that
        // assigning an object to the pointer that holds its last reference keeps it alive.
        if (other.p_ != p_) {
            if (other.p_)
                other.p_->addRef();
            T* old = std::exchange(p_, other.p_);
            if (old)
                old->release();
        }
        return *this;
    }
    IntrusivePtr& operator=(IntrusivePtr&& other) noexcept {
        if (this != &other) {
            T* old = std::exchange(p_, std::exchange(other.p_, nullptr));
            if (old)
                old->release();
        }
        return *this;
    }
    ~IntrusivePtr() { reset(); }

    void reset() noexcept {
        if (T* old = std::exchange(p_, nullptr))
            old->release();
    }
    T* get() const noexcept { return p_; }
    T* operator->() const noexcept { return p_; }
    T& operator*() const noexcept { return *p_; }
    explicit operator bool() const noexcept { return p_ != nullptr; }
    // Hands the reference to the caller without releasing it.
    [[nodiscard]] T* detach() noexcept { return std::exchange(p_, nullptr); }

private:
    T* p_ = nullptr;
};

} // namespace ZYRStd::detail
