/// \file
/// The one reference-count word and the one intrusive pointer behind every counted object
/// and smart pointer of the library, internal and public alike.
#pragma once

#include <atomic>
#include <utility>

namespace ZYRStd::detail {

/// Every count operation of the library, on an atomic word or a bare one seen through
/// std::atomic_ref. The memory orders, once for all of them:
/// - an increment is relaxed: a new reference is taken from one already held, so the object
///   is alive and nothing needs ordering;
/// - a decrement is acquire-release: release publishes this owner's writes, and acquire on
///   the one that reaches 0 makes every owner's writes visible to the destructor;
/// - a read is acquire, so that "not shared" lets the reader act on what others wrote.
struct RefCountOps {
    /// Adds one reference (relaxed).
    template <class Word> static void increment(Word& word) noexcept {
        word.fetch_add(1, std::memory_order_relaxed);
    }
    /// Returns the new count.
    template <class Word> static unsigned int decrement(Word& word) noexcept {
        return word.fetch_sub(1, std::memory_order_acq_rel) - 1;
    }
    /// The present count (acquire).
    template <class Word> static unsigned int value(const Word& word) noexcept {
        return word.load(std::memory_order_acquire);
    }
};

/// A count that starts at 1, for its creator. Copies carry the count word over unchanged, as
/// a memberwise copy would.
class RefCountWord {
public:
    RefCountWord() noexcept = default;
    /// Copies the count as a memberwise copy would.
    RefCountWord(const RefCountWord& other) noexcept
        : word_(other.word_.load(std::memory_order_relaxed)) {}
    /// Copies the count as a memberwise copy would.
    RefCountWord& operator=(const RefCountWord& other) noexcept {
        word_.store(other.word_.load(std::memory_order_relaxed), std::memory_order_relaxed);
        return *this;
    }

    /// Adds one reference.
    void increment() const noexcept { RefCountOps::increment(word_); }
    /// Drops one reference; returns the new count.
    unsigned int decrement() const noexcept { return RefCountOps::decrement(word_); }
    /// The present count.
    unsigned int value() const noexcept { return RefCountOps::value(word_); }
    /// The address of the count word, for the debugging hooks of the public interfaces.
    const unsigned int* address() const noexcept {
        static_assert(sizeof(std::atomic<unsigned int>) == sizeof(unsigned int));
        return reinterpret_cast<const unsigned int*>(&word_);
    }

private:
    mutable std::atomic<unsigned int> word_{1};
};

/// Holds one reference to an object with addRef() and release(); the object deletes itself
/// on its last release.
template <class T> class IntrusivePtr {
public:
    IntrusivePtr() noexcept = default;
    /// `addRef` false adopts the reference the caller already holds.
    IntrusivePtr(T* p, bool addRef) noexcept : p_(p) {
        if (p_ && addRef)
            p_->addRef();
    }
    /// Shares the object: one more reference.
    IntrusivePtr(const IntrusivePtr& other) noexcept : IntrusivePtr(other.p_, true) {}
    /// Takes over the other's reference; the other becomes null.
    IntrusivePtr(IntrusivePtr&& other) noexcept : p_(std::exchange(other.p_, nullptr)) {}
    /// Shares the other's object and releases the one held before.
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
    /// Takes over the other's reference and releases the one held before.
    IntrusivePtr& operator=(IntrusivePtr&& other) noexcept {
        if (this != &other) {
            T* old = std::exchange(p_, std::exchange(other.p_, nullptr));
            if (old)
                old->release();
        }
        return *this;
    }
    ~IntrusivePtr() { reset(); }

    /// Releases the held reference; the pointer becomes null.
    void reset() noexcept {
        if (T* old = std::exchange(p_, nullptr))
            old->release();
    }
    /// The object, borrowed; null when empty.
    T* get() const noexcept { return p_; }
    /// The object, borrowed.
    T* operator->() const noexcept { return p_; }
    /// The object, borrowed; the pointer must not be null.
    T& operator*() const noexcept { return *p_; }
    /// True when an object is held.
    explicit operator bool() const noexcept { return p_ != nullptr; }
    /// Hands the reference to the caller without releasing it.
    [[nodiscard]] T* detach() noexcept { return std::exchange(p_, nullptr); }

private:
    T* p_ = nullptr;
};

} // namespace ZYRStd::detail
