#pragma once

#include <memory>
#include <utility>

namespace Corvo::DSP {

// Somebody who wants to hear about a change. The chain it is added to owns it.
template <typename... Args>
class EqListener {
public:
    EqListener() = default;
    // A copy stands alone: it is in no chain.
    EqListener(const EqListener&) {}
    EqListener& operator=(const EqListener&) { return *this; }
    virtual ~EqListener() = default;
    // A copy of this listener, in no chain.
    virtual std::unique_ptr<EqListener> Clone() const = 0;
    // The change, on the thread of the setter that made it.
    virtual void Invoke(Args... args) = 0;

private:
    template <typename...>
    friend class EqNotificationChain;
    std::unique_ptr<EqListener> m_next;
};

// The listeners of one kind of change: a singly linked list behind one owned pointer. Copies clone every
// listener. A listener must not change the chain that is invoking it.
template <typename... Args>
class EqNotificationChain {
public:
    using Listener = EqListener<Args...>;  // who is told

    EqNotificationChain() = default;
    // A clone of every listener, in the same order.
    EqNotificationChain(const EqNotificationChain& other) {
        auto* end = &m_head;
        for (const Listener* listener = other.m_head.get(); listener; listener = listener->m_next.get()) {
            if (auto copy = listener->Clone()) {
                *end = std::move(copy);
                end = &(*end)->m_next;
            }
        }
    }
    // As copying; the listeners there were are destroyed.
    EqNotificationChain& operator=(const EqNotificationChain& other) {
        if (this != &other) {
            EqNotificationChain copy(other);
            std::swap(m_head, copy.m_head);
        }
        return *this;
    }
    ~EqNotificationChain() {
        while (m_head) m_head = std::move(m_head->m_next);
    }

    // Takes the listener over, as the new head; null is ignored. Listeners are told in the order in which
    // they were added.
    void Add(std::unique_ptr<Listener> listener) {
        if (!listener) return;
        listener->m_next = std::move(m_head);
        m_head = std::move(listener);
    }
    // Tells every listener, the head last.
    void Invoke(Args... args) const {
        if (m_head) InvokeFrom(*m_head, args...);
    }
    // Whether nobody listens.
    bool IsEmpty() const { return m_head == nullptr; }

private:
    static void InvokeFrom(Listener& listener, Args... args) {
        if (listener.m_next) InvokeFrom(*listener.m_next, args...);
        listener.Invoke(args...);
    }

    std::unique_ptr<Listener> m_head;
};

}  // namespace Corvo::DSP
