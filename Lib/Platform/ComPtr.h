#pragma once

#include "IUnknown.h"

#include <utility>

// Holds one reference to an interface and releases it when dropped.
template <class T>
class ComPtr
{
public:
    ComPtr() = default;
    // Takes over a reference the caller already owns.
    explicit ComPtr(T* adopted) : m_ptr(adopted) {}
    ~ComPtr() { reset(); }
    ComPtr(const ComPtr& other) : m_ptr(other.m_ptr)
    {
        if (m_ptr != nullptr)
            m_ptr->AddRef();
    }
    ComPtr& operator=(const ComPtr& other)
    {
        ComPtr copy(other);
        swap(copy);
        return *this;
    }
    ComPtr(ComPtr&& other) noexcept : m_ptr(std::exchange(other.m_ptr, nullptr)) {}
    ComPtr& operator=(ComPtr&& other) noexcept
    {
        ComPtr moved(std::move(other));
        swap(moved);
        return *this;
    }

    T* get() const { return m_ptr; }
    T* operator->() const { return m_ptr; }
    explicit operator bool() const { return m_ptr != nullptr; }

    // Releases what is held and takes over `adopted`.
    void reset(T* adopted = nullptr)
    {
        T* old = std::exchange(m_ptr, adopted);
        if (old != nullptr)
            old->Release();
    }
    // The held pointer as an out parameter for calls that release and replace it themselves.
    T*& ref() { return m_ptr; }
    void swap(ComPtr& other) noexcept { std::swap(m_ptr, other.m_ptr); }

private:
    T* m_ptr = nullptr;
};
