#include "LQ_StateAggregator.h"

#include <dirent.h>
#include <sys/stat.h>

namespace LQ {

namespace {
std::string replaceAll(std::string text, const std::string& from, const std::string& to) {
    for (size_t at = text.find(from); at != std::string::npos; at = text.find(from, at + to.size()))
        text.replace(at, from.size(), to);
    return text;
}

// makes each missing directory on the way to the file
void makeParentDirectories(const std::string& path) {
    const size_t last = path.rfind('/');
    if (last == std::string::npos || last == 0) return;
    for (size_t i = 1; i <= last; ++i) {
        if (i < last && path[i] != '/') continue;
        const std::string prefix = path.substr(0, i);
        DIR* directory = opendir(prefix.c_str());
        if (directory)
            closedir(directory);
        else
            mkdir(prefix.c_str(), 0777);
    }
}
}  // namespace

int StateAggregator::numBaseStates_ = 0;

std::vector<StateAggregator*>& StateAggregator::staticDetectorStates() {
    static std::vector<StateAggregator*> aggregators;
    return aggregators;
}

std::ofstream& StateAggregator::dotFile() {
    static std::ofstream file;
    return file;
}

StateAggregator::StateAggregator() : states_(numBaseStates_, nullptr) {
    std::vector<StateAggregator*>& registry = staticDetectorStates();
    registryIndex_ = registry.size();
    registry.push_back(this);
}

StateAggregator::~StateAggregator() {
    for (BaseState* state : states_) delete state;
    // swap the last entry into our place so removal stays constant time
    std::vector<StateAggregator*>& registry = staticDetectorStates();
    StateAggregator* last = registry.back();
    registry[registryIndex_] = last;
    last->registryIndex_ = registryIndex_;
    registry.pop_back();
}

SharedPtr<StateAggregator> StateAggregator::newDetectorState() {
    return SharedPtr<StateAggregator>(new StateAggregator());
}

int StateAggregator::getId() {
    ++numBaseStates_;
    for (StateAggregator* aggregator : staticDetectorStates()) aggregator->states_.resize(numBaseStates_, nullptr);
    return numBaseStates_ - 1;
}

size_t StateAggregator::liveCount() { return staticDetectorStates().size(); }

void StateAggregator::reset() {
    for (BaseState* state : states_)
        if (state) state->reset();
}

std::ostream& operator<<(std::ostream& stream, const StateAggregator& aggregator) {
    stream << "StateAggregator(";
    bool first = true;
    for (const BaseState* state : aggregator.states_) {
        if (!state) continue;
        if (!first) stream << ", ";
        first = false;
        state->print(stream);
    }
    return stream << ")";
}

std::ostream& operator<<(std::ostream& stream, const BaseState& state) {
    state.print(stream);
    return stream;
}

void writeDotRow(std::ostream& stream, const std::string& printed) {
    const std::string text = replaceAll(printed, "\n", "<br align=\"left\"/>");
    const size_t open = text.find('(');
    const std::string name = text.substr(0, open);
    std::string value;
    if (open != std::string::npos) {
        value = text.substr(open + 1);
        if (!value.empty() && value.back() == ')') value.pop_back();
    }
    stream << "<tr><td border=\"1\">" << name << "</td><td align=\"left\" border=\"1\">" << value
           << "<br align=\"left\"/>" << "</td></tr>\n";
}

void BaseState::saveToDot(std::ostream& stream, StateAggregator* owner) {
    std::ostringstream printed;
    print(printed);
    writeDotRow(stream, printed.str());
}

void StateAggregator::saveToDot() {
    // The rows go to a buffer first: child nodes and edges are written to the file while
    // the rows are made, and must not land inside this node's label.
    std::ostringstream rows;
    for (BaseState* state : states_)
        if (state) state->saveToDot(rows, this);
    std::ofstream& dot = dotFile();
    dot << "\"" << static_cast<const void*>(this) << "\""
        << "[shape=plaintext label = <<table border=\"0\" cellspacing=\"0\">" << rows.str() << "</table>>]\n";
}

void StateAggregator::saveToDot(const std::string& path) {
    makeParentDirectories(path);
    std::ofstream& dotFile_ = dotFile();
    dotFile_.open(path.c_str(), std::ios::out | std::ios::trunc);
    LQ_ASSERT_MSG(dotFile_.is_open(), path);
    dotFile_ << "digraph {\n" << "rankdir=LR\n" << "node[fontname=\"monospace\"]\n";
    saveToDot();
    dotFile_ << "}\n\n";
    dotFile_.close();
}

void saveChildrenToDot(std::ostream& stream, StateAggregator* owner, const char* name,
                       const std::vector<SharedPtr<StateAggregator>>& children) {
    stream << "<tr><td border=\"1\">" << name << "</td><td align=\"left\" border=\"1\" port=\"" << name << "\">"
           << "vector[" << children.size() << "]" << "<br align=\"left\"/>" << "</td></tr>\n";
    std::ofstream& dot = StateAggregator::dotFile();
    for (const SharedPtr<StateAggregator>& child : children) {
        dot << "\"" << static_cast<const void*>(owner) << "\":" << name << " -> \""
            << static_cast<const void*>(child.get()) << "\"\n";
        child->saveToDot();
    }
}

}  // namespace LQ
