// SPDX-License-Identifier: Apache-2.0
#pragma once

#include <cstddef>
#include <cstdint>
#include <list>
#include <memory>
#include <type_traits>
#include <utility>

#include "Utils/Exception.h"
#include "Utils/Export.h"
#include "Utils/Os/Linux/Mutex.h"

namespace utils {

/// A locked list of pointers that may own its elements. T is a pointer type; what it points to need be
/// complete only where a list is constructed. Each operation takes the list's mutex for its duration.
template <typename T>
class QUENX_EXPORT SafeList {
    static_assert(std::is_pointer_v<T>, "a SafeList holds pointers");

  public:
    /// The way in which an Iterator walks. A null element is the end. Derive from it to walk something else.
    class QUENX_EXPORT IteratorImplementation {
      public:
        IteratorImplementation() = default;
        IteratorImplementation(const IteratorImplementation&) = delete;
        IteratorImplementation& operator=(const IteratorImplementation&) = delete;

        virtual T next() = 0;
        virtual T first() = 0;
        virtual std::size_t size() = 0;
        virtual ~IteratorImplementation() = default;
        /// Another one over the same elements, at their beginning.
        virtual std::unique_ptr<IteratorImplementation> clone() = 0;
    };

    /// Walks a SafeList itself, without a copy: elements that are added before it has returned the last one
    /// are met. The list must outlive it. After a clear() it is at its end until the next first().
    class QUENX_EXPORT SimpleIteratorImplementation : public IteratorImplementation {
      public:
        /// A null list has no elements.
        explicit SimpleIteratorImplementation(SafeList* list);

        T next() override;
        T first() override;
        std::size_t size() override;
        ~SimpleIteratorImplementation() override = default;
        std::unique_ptr<IteratorImplementation> clone() override;

        /// The step of next(), for a caller that holds the list's mutex.
        virtual T internalNext();

      private:
        void rewind();

        typename std::list<T>::iterator m_position;
        SafeList* m_list;
        std::uint32_t m_clearCount = 0;
    };

    /// What callers walk with: first() once, then next() until null. Copying one transfers its implementation
    /// and leaves the source empty. Not for use by two threads at once.
    class QUENX_EXPORT Iterator {
      public:
        /// Empty until assigned to.
        Iterator() = default;
        explicit Iterator(std::unique_ptr<IteratorImplementation> implementation)
            : m_implementation(std::move(implementation)) {}
        Iterator(Iterator& other) noexcept : m_implementation(std::move(other.m_implementation)) {}
        Iterator(Iterator&&) noexcept = default;
        Iterator& operator=(Iterator& other) noexcept;
        Iterator& operator=(Iterator&&) noexcept = default;

        /// @throws Exception, all three, when the implementation was transferred away
        virtual T first();
        virtual ~Iterator() = default;
        T next();
        std::size_t size();

      private:
        std::unique_ptr<IteratorImplementation> m_implementation;
    };

    /// A derived list that keeps elements in its own way. What is done through the base reaches it too.
    class ElementOwner {
      public:
        virtual void add(T element) = 0;
        virtual void clear() = 0;

      protected:
        ~ElementOwner() = default;
    };

    /// An owning list deletes its elements when it is cleared or destroyed.
    explicit SafeList(bool owning = false) : m_owning(owning) {}
    virtual ~SafeList();

    SafeList(const SafeList&) = delete;
    SafeList& operator=(const SafeList&) = delete;

    /// An iterator over this list, which must outlive it.
    virtual Iterator getElements();

    /// Appends the element.
    void add(T element);
    std::size_t size();
    /// Deletes the elements if owning, front to back, then empties the list.
    void clear();

    /// The list itself, for a caller that holds getMutex(). An element that is taken out must not be one at
    /// which an iterator stands.
    std::list<T>& getStlList() QUENX_NO_THREAD_SAFETY_ANALYSIS { return m_elements; }
    Mutex& getMutex() QUENX_RETURN_CAPABILITY(m_mutex) { return m_mutex; }

  protected:
    /// For the derived list's constructor and destructor: from the one to the other, it is in charge.
    void setElementOwner(ElementOwner* owner) { m_elementOwner = owner; }

  private:
    const bool m_owning;
    std::list<T> m_elements QUENX_GUARDED_BY(m_mutex);
    Mutex m_mutex;
    std::uint32_t m_clearCount QUENX_GUARDED_BY(m_mutex) = 0;
    ElementOwner* m_elementOwner = nullptr;
};

template <typename T>
SafeList<T>::~SafeList() {
    clear();
}

template <typename T>
typename SafeList<T>::Iterator SafeList<T>::getElements() {
    return Iterator(std::make_unique<SimpleIteratorImplementation>(this));
}

template <typename T>
void SafeList<T>::add(T element) {
    if (m_elementOwner != nullptr) return m_elementOwner->add(element);
    Mutex::AutoLocker locker(m_mutex);
    m_elements.push_back(element);
}

template <typename T>
std::size_t SafeList<T>::size() {
    Mutex::AutoLocker locker(m_mutex);
    return m_elements.size();
}

template <typename T>
void SafeList<T>::clear() {
    if (m_elementOwner != nullptr) return m_elementOwner->clear();
    Mutex::AutoLocker locker(m_mutex);
    ++m_clearCount;
    if (m_owning) {
        for (T element : m_elements)
            delete element;
    }
    m_elements.clear();
}

template <typename T>
SafeList<T>::SimpleIteratorImplementation::SimpleIteratorImplementation(SafeList* list) : m_list(list) {
    if (m_list == nullptr) return;
    Mutex::AutoLocker locker(m_list->m_mutex);
    rewind();
}

template <typename T>
void SafeList<T>::SimpleIteratorImplementation::rewind() QUENX_NO_THREAD_SAFETY_ANALYSIS {
    m_position = m_list->m_elements.begin();
    m_clearCount = m_list->m_clearCount;
}

template <typename T>
T SafeList<T>::SimpleIteratorImplementation::next() {
    if (m_list == nullptr) return internalNext();
    Mutex::AutoLocker locker(m_list->m_mutex);
    return internalNext();
}

template <typename T>
T SafeList<T>::SimpleIteratorImplementation::first() {
    if (m_list == nullptr) return internalNext();
    Mutex::AutoLocker locker(m_list->m_mutex);
    rewind();
    return internalNext();
}

template <typename T>
std::size_t SafeList<T>::SimpleIteratorImplementation::size() {
    return m_list == nullptr ? 0 : m_list->size();
}

template <typename T>
std::unique_ptr<typename SafeList<T>::IteratorImplementation>
SafeList<T>::SimpleIteratorImplementation::clone() {
    return std::make_unique<SimpleIteratorImplementation>(m_list);
}

template <typename T>
T SafeList<T>::SimpleIteratorImplementation::internalNext() QUENX_NO_THREAD_SAFETY_ANALYSIS {
    // A position from before a clear() points nowhere.
    if (m_list == nullptr || m_clearCount != m_list->m_clearCount || m_position == m_list->m_elements.end()) {
        return nullptr;
    }
    return *m_position++;
}

template <typename T>
typename SafeList<T>::Iterator& SafeList<T>::Iterator::operator=(Iterator& other) noexcept {
    if (this != &other) m_implementation = std::move(other.m_implementation);
    return *this;
}

// The line numbers in the assertions are fixed; log readers know them.
template <typename T>
T SafeList<T>::Iterator::next() {
    QUENX_ASSERT_TEXT(m_implementation != nullptr, __FILE__, 147, "implementation != __null");
    return m_implementation->next();
}

template <typename T>
T SafeList<T>::Iterator::first() {
    QUENX_ASSERT_TEXT(m_implementation != nullptr, __FILE__, 156, "implementation != __null");
    return m_implementation->first();
}

template <typename T>
std::size_t SafeList<T>::Iterator::size() {
    QUENX_ASSERT_TEXT(m_implementation != nullptr, __FILE__, 164, "implementation != __null");
    return m_implementation->size();
}

}  // namespace utils
