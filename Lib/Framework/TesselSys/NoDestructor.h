#pragma once

#include <new>
#include <utility>

// Storage for a process-wide object that is built on first use and never destroyed, so code
// running during process exit (static destructors, late handlers) still finds it intact.
// Whatever it owns stays reachable from static storage.
template <class T>
class NoDestructor
{
public:
    template <class... Args>
    explicit NoDestructor(Args&&... args)
    {
        new (m_storage) T(std::forward<Args>(args)...);
    }
    NoDestructor(const NoDestructor&) = delete;
    NoDestructor& operator=(const NoDestructor&) = delete;

    T& get() { return *std::launder(reinterpret_cast<T*>(m_storage)); }

private:
    alignas(T) unsigned char m_storage[sizeof(T)];
};
