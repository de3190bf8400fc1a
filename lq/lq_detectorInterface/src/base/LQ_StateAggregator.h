#pragma once
// The typed bag of states of the frame or of one object. Detectors keep nothing per
// object in themselves: whatever belongs to an object lives in its aggregator, one state
// of each type, numbered process-wide on first use of the type.

#include <fstream>
#include <map>
#include <ostream>
#include <sstream>
#include <string>
#include <vector>

#include "LQ_SharedPtr.h"
#include "LQ_Stream.h"
#include "LQ_Utils.h"

namespace LQ {

class StateAggregator;

class BaseState {
public:
    virtual ~BaseState() = default;
    virtual void reset() = 0;
    virtual void print(std::ostream& stream) const = 0;
    // one row of the owner's table in the graph dump
    virtual void saveToDot(std::ostream& stream, StateAggregator* owner);
};

std::ostream& operator<<(std::ostream& stream, const BaseState& state);

class StateAggregator {
public:
    ~StateAggregator();
    StateAggregator(const StateAggregator&) = delete;
    StateAggregator& operator=(const StateAggregator&) = delete;

    static SharedPtr<StateAggregator> newDetectorState();
    // hands out the next state number and grows every live aggregator to it
    static int getId();

    // the state of type T, made with its default value on first request
    template <class T>
    T& get() {
        const int id = T::id();
        BaseState*& slot = states_[id];
        if (!slot) slot = new T();
        return static_cast<T&>(*slot);
    }
    template <class T>
    void operator=(const T& state) {
        get<T>() = state;
    }
    // the state if it exists, else null; never creates
    template <class T>
    T* find() const {
        BaseState* state = states_[T::id()];
        return state ? static_cast<T*>(state) : nullptr;
    }

    // every existing state back to its default; the states stay
    void reset();

    // Writes a graph file of this aggregator and all below it.
    void saveToDot(const std::string& path);
    // Writes this aggregator as one node (and its children) into dotFile().
    void saveToDot();
    static std::ofstream& dotFile();

    // how many aggregators are alive; the registry holds only those
    static size_t liveCount();
    static int numBaseStates() { return numBaseStates_; }

    friend std::ostream& operator<<(std::ostream& stream, const StateAggregator& aggregator);

private:
    StateAggregator();

    std::vector<BaseState*> states_;
    size_t registryIndex_ = 0;

    static int numBaseStates_;
    // Live aggregators only: each one removes itself when its last owner lets go, so a
    // long run that makes an aggregator per object found does not grow this list.
    static std::vector<StateAggregator*>& staticDetectorStates();
};

std::ostream& operator<<(std::ostream& stream, const StateAggregator& aggregator);

// Writes the default table row for a printed state text "Name(value)".
void writeDotRow(std::ostream& stream, const std::string& printed);

// ---- state templates ------------------------------------------------------------
// Tag types give every instance its own type, its own number and its printed name.

#define LQ_STATE_ID                                                                           \
    static int id() {                                                                         \
        static const int value = ::LQ::StateAggregator::getId();                             \
        return value;                                                                         \
    }

// The state is a T with the state's interface.
template <class T, class Tag>
class InheritedState : public BaseState, public T {
public:
    LQ_STATE_ID
    InheritedState() : T() {}
    InheritedState(const T& value) : T(value) {}
    InheritedState& operator=(const T& value) {
        static_cast<T&>(*this) = value;
        return *this;
    }
    T& value() { return *this; }
    const T& value() const { return *this; }
    void reset() override { static_cast<T&>(*this) = T(); }
    void print(std::ostream& stream) const override {
        stream << Tag::name() << "(";
        StreamO(stream) << static_cast<const T&>(*this);
        stream << ")";
    }
};

// A state that is also a T would print ambiguously through either base.
template <class T, class Tag>
std::ostream& operator<<(std::ostream& stream, const InheritedState<T, Tag>& state) {
    state.print(stream);
    return stream;
}

// One value of T, with conversions to and from T.
template <class T, class Tag>
class NumericState : public BaseState {
public:
    LQ_STATE_ID
    NumericState(T value = T()) : value_(value) {}
    NumericState& operator=(T value) {
        value_ = value;
        return *this;
    }
    operator T() const { return value_; }
    operator T&() { return value_; }
    T& value() { return value_; }
    const T& value() const { return value_; }
    void reset() override { value_ = T(); }
    void print(std::ostream& stream) const override { stream << Tag::name() << "(" << value_ << ")"; }

private:
    T value_;
};

// Prints the name only: used for links that would print half the engine.
template <class T, class Tag>
class InheritedNoPrintState : public InheritedState<T, Tag> {
public:
    using InheritedState<T, Tag>::InheritedState;
    using InheritedState<T, Tag>::operator=;
    void print(std::ostream& stream) const override { stream << Tag::name() << "()"; }
};

// Containers of child aggregators whose graph dump follows the children.
void saveChildrenToDot(std::ostream& stream, StateAggregator* owner, const char* name,
                       const std::vector<SharedPtr<StateAggregator>>& children);
template <class K, class C, class A>
void saveChildrenToDot(std::ostream& stream, StateAggregator* owner, const char* name,
                       const std::map<K, std::vector<SharedPtr<StateAggregator>>, C, A>& children);

template <class T, class Tag>
class InheritedStateDot : public InheritedState<T, Tag> {
public:
    using InheritedState<T, Tag>::InheritedState;
    using InheritedState<T, Tag>::operator=;
    void saveToDot(std::ostream& stream, StateAggregator* owner) override {
        saveChildrenToDot(stream, owner, Tag::name(), static_cast<const T&>(*this));
    }
};

template <class K, class C, class A>
void saveChildrenToDot(std::ostream& stream, StateAggregator* owner, const char* name,
                       const std::map<K, std::vector<SharedPtr<StateAggregator>>, C, A>& children) {
    stream << "<tr><td border=\"1\">" << name << "</td><td align=\"left\" border=\"1\" port=\"" << name << "\">"
           << "map[" << children.size() << "]" << "<br align=\"left\"/>" << "</td></tr>\n";
    std::ofstream& dot = StateAggregator::dotFile();
    for (const auto& entry : children) {
        dot << "\"" << static_cast<const void*>(owner) << "\":" << name << " -> " << entry.first << "\n";
        for (const SharedPtr<StateAggregator>& child : entry.second) {
            dot << entry.first << " -> \"" << static_cast<const void*>(child.get()) << "\"\n";
            child->saveToDot();
        }
    }
}

// Declares a state type: the tag _Name that prints "Name", and Name itself.
#define LQ_DECLARE_STATE(Name, Template, ...)                                                 \
    struct _##Name {                                                                          \
        static const char* name() { return #Name; }                                           \
    };                                                                                        \
    typedef Template<__VA_ARGS__, _##Name> Name

}  // namespace LQ
