#ifndef QV_PLATFORM_UTILS_VECTOR_H
#define QV_PLATFORM_UTILS_VECTOR_H

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <sys/types.h>
#include <type_traits>

namespace android
{

// Stands in for the platform's vector where there is none: the operations that the library
// calls, for items that are copied as bytes. Growing never throws: if the allocation fails, the
// item is not added and the call returns an error.
template <class T>
class Vector
{
    static_assert(std::is_trivially_copyable<T>::value, "items are moved as bytes");

public:
    Vector() = default;
    Vector(const Vector&) = delete;
    Vector& operator=(const Vector&) = delete;
    ~Vector() { std::free(m_pItems); }

    size_t size() const { return m_uCount; }
    bool isEmpty() const { return m_uCount == 0; }
    size_t capacity() const { return m_uCapacity; }
    const T* array() const { return m_pItems; }
    T* editArray() { return m_pItems; }

    // The index must be below size().
    const T& operator[](size_t uIndex) const { return m_pItems[uIndex]; }
    const T& itemAt(size_t uIndex) const { return m_pItems[uIndex]; }
    T& editItemAt(size_t uIndex) { return m_pItems[uIndex]; }

    // Appends an item; its index, or -1 if the allocation fails.
    ssize_t add(const T& item)
    {
        if (m_uCount == m_uCapacity && setCapacity(m_uCapacity * 2 + FIRST_CAPACITY) < 0)
        {
            return -1;
        }
        m_pItems[m_uCount] = item;
        return static_cast<ssize_t>(m_uCount++);
    }
    void push(const T& item) { add(item); }

    // Overwrites the item at uIndex; uIndex, or -1 when there is none.
    ssize_t replaceAt(const T& item, size_t uIndex)
    {
        if (uIndex >= m_uCount)
        {
            return -1;
        }
        m_pItems[uIndex] = item;
        return static_cast<ssize_t>(uIndex);
    }

    // Makes room for uCapacity items; the room, or -1 if the allocation fails. Never shrinks.
    ssize_t setCapacity(size_t uCapacity)
    {
        if (uCapacity > MAX_CAPACITY)
        {
            return -1;
        }
        if (uCapacity > m_uCapacity)
        {
            void* pItems = std::realloc(static_cast<void*>(m_pItems), uCapacity * sizeof(T));
            if (pItems == nullptr)
            {
                return -1;
            }
            m_pItems = static_cast<T*>(pItems);
            m_uCapacity = uCapacity;
        }
        return static_cast<ssize_t>(m_uCapacity);
    }

    void clear()
    {
        std::free(m_pItems);
        m_pItems = nullptr;
        m_uCount = 0;
        m_uCapacity = 0;
    }

private:
    static constexpr size_t FIRST_CAPACITY = 4;
    // No block is larger than a difference of pointers can hold.
    static constexpr size_t MAX_CAPACITY = PTRDIFF_MAX / sizeof(T);

    T* m_pItems = nullptr;
    size_t m_uCount = 0;
    size_t m_uCapacity = 0;
};

} // namespace android

#endif
