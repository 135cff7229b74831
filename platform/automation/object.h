// Reference-counted automation objects: interface query by dynamic cast, and
// late-bound calls by member name with variant arguments.
//
// Every class of the system derives `public virtual Object`, and so does every
// interface, so that an object implementing several interfaces has exactly one
// reference count and any interface pointer can be held in a Ref.
#pragma once

#include <atomic>
#include <cstdint>
#include <span>
#include <string>
#include <string_view>
#include <utility>

namespace pelta {

class Variant;

enum class CallKind : uint8_t { Method, PropertyGet, PropertyPut };

class Object {
public:
    Object() noexcept;
    Object(const Object&) = delete;
    Object& operator=(const Object&) = delete;
    virtual ~Object();

    void addRef() const noexcept { refs_.fetch_add(1, std::memory_order_relaxed); }
    void release() const noexcept {
        if (refs_.fetch_sub(1, std::memory_order_acq_rel) == 1) delete this;
    }
    int32_t refCount() const noexcept { return refs_.load(std::memory_order_relaxed); }

    // Late-bound call of `member` (name compared without regard to case).
    // Arguments are passed by reference: a callee may write back into them.
    // The default raises error 438.
    virtual Variant invoke(std::string_view member, CallKind kind, std::span<Variant> args);

    // The type name as automation reports it (`TypeName`).
    virtual std::string typeName() const;

    // Number of objects alive in the process (all modules).
    static int64_t liveObjects() noexcept;

private:
    mutable std::atomic<int32_t> refs_{0};
};

// Intrusive strong reference, the automation object reference.
template <class T>
class Ref {
public:
    Ref() noexcept = default;
    Ref(std::nullptr_t) noexcept {}
    Ref(T* p) noexcept : p_(p) {
        if (p_) obj(p_)->addRef();
    }
    Ref(const Ref& o) noexcept : Ref(o.p_) {}
    Ref(Ref&& o) noexcept : p_(std::exchange(o.p_, nullptr)) {}
    template <class U>
    Ref(const Ref<U>& o) noexcept : Ref(static_cast<T*>(o.get())) {}
    template <class U>
    Ref(Ref<U>&& o) noexcept : p_(static_cast<T*>(o.detach())) {}
    ~Ref() {
        if (p_) obj(p_)->release();
    }

    Ref& operator=(Ref o) noexcept {
        std::swap(p_, o.p_);
        return *this;
    }

    T* get() const noexcept { return p_; }
    T* operator->() const noexcept { return p_; }
    T& operator*() const noexcept { return *p_; }
    explicit operator bool() const noexcept { return p_ != nullptr; }
    T* detach() noexcept { return std::exchange(p_, nullptr); }
    void reset() noexcept { Ref().swap(*this); }
    void swap(Ref& o) noexcept { std::swap(p_, o.p_); }

    friend bool operator==(const Ref& a, const Ref& b) noexcept { return a.p_ == b.p_; }
    friend bool operator==(const Ref& a, std::nullptr_t) noexcept { return a.p_ == nullptr; }

private:
    static const Object* obj(const T* p) noexcept { return p; }
    T* p_ = nullptr;
};

using ObjectRef = Ref<Object>;

template <class T, class... A>
Ref<T> makeRef(A&&... a) {
    return Ref<T>(new T(std::forward<A>(a)...));
}

// Interface query: the interface `I` of `o`, or null when `o` does not implement it.
template <class I, class T>
I* query(T* o) noexcept {
    return o ? dynamic_cast<I*>(o) : nullptr;
}
template <class I, class T>
Ref<I> queryRef(const Ref<T>& o) noexcept {
    return Ref<I>(query<I>(o.get()));
}
template <class I, class T>
bool implements(T* o) noexcept {
    return query<I>(o) != nullptr;
}

// Case-insensitive (ASCII) comparison of a member name.
bool memberIs(std::string_view member, std::string_view name) noexcept;

// Late-bound call helpers.
Variant callByName(Object* o, std::string_view member, std::span<Variant> args = {});
Variant getProperty(Object* o, std::string_view member);
void putProperty(Object* o, std::string_view member, const Variant& value);

}  // namespace pelta
