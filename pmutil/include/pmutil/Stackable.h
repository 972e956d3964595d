// SPDX-FileCopyrightText: 2026 the assay authors
// SPDX-License-Identifier: MIT

// A process-wide stack of the live objects of a class, oldest first.
#pragma once

#include <algorithm>
#include <utility>
#include <vector>

#include <boost/make_shared.hpp>
#include <boost/shared_ptr.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/recursive_mutex.hpp>

namespace pmutil {

class StackableBase {
public:
    virtual ~StackableBase() = default;
};

template <typename T>
class Stackable;

// A pointer to an object on the stack. It shares ownership of the stack, so that the stack outlives
// the last user at process exit. May be empty.
template <typename T>
class StackableHolder {
public:
    StackableHolder() = default;
    StackableHolder(boost::shared_ptr<std::vector<Stackable<T>*>> stack, T* object)
        : fStack(std::move(stack)), fObject(object)
    {}

    explicit operator bool() const { return fObject != nullptr; }
    T* operator->() const { return fObject; }
    T* get() const { return fObject; }

private:
    boost::shared_ptr<std::vector<Stackable<T>*>> fStack;
    T* fObject = nullptr;
};

// The constructor pushes the object onto the stack of live T; the destructor removes it.
template <typename T>
class Stackable : public StackableBase {
public:
    using Stack = boost::shared_ptr<std::vector<Stackable<T>*>>;

    Stackable(const Stackable&) = delete;
    Stackable& operator=(const Stackable&) = delete;

    ~Stackable() override
    {
        boost::lock_guard<boost::recursive_mutex> lock(Mutex());
        fStack->erase(std::remove(fStack->begin(), fStack->end(), this), fStack->end());
    }

    // Returns the youngest live object; an empty holder if there is none.
    static StackableHolder<T> Top()
    {
        boost::lock_guard<boost::recursive_mutex> lock(Mutex());
        Stack stack = Instances();
        T* const top = stack->empty() ? nullptr : static_cast<T*>(stack->back());
        return StackableHolder<T>(std::move(stack), top);
    }

    // Returns the object that was pushed before `object`; null if there is none.
    static T* Below(const T* object)
    {
        boost::lock_guard<boost::recursive_mutex> lock(Mutex());
        const std::vector<Stackable<T>*>& stack = *Instances();
        const auto found = std::find(stack.begin(), stack.end(), object);
        return found == stack.begin() || found == stack.end() ? nullptr
                                                              : static_cast<T*>(*(found - 1));
    }

    // Guards the stack. Lock order: the log mutex first.
    static boost::recursive_mutex& Mutex()
    {
        static boost::recursive_mutex& mutex = *new boost::recursive_mutex; // never destroyed
        return mutex;
    }

protected:
    Stackable()
    {
        boost::lock_guard<boost::recursive_mutex> lock(Mutex());
        fStack = Instances();
        // The T isn't constructed yet: Top and Below convert the pointer later.
        fStack->push_back(this);
    }

private:
    static Stack Instances()
    {
        static const Stack& stack = *new Stack(boost::make_shared<std::vector<Stackable<T>*>>());
        return stack; // never destroyed
    }

    Stack fStack;
};

} // namespace pmutil
