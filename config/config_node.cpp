#include "config/config_node.h"

#include <cstdint>
#include <cstring>
#include <stdexcept>
#include <typeinfo>
#include <utility>

#include <boost/lexical_cast/bad_lexical_cast.hpp>

#include "config/config_limits.h"
#include "config/config_messages.h"
#include "config/value_text.h"
#include "image/error_detail.h"

namespace config {

using img::DetailedError;

namespace {

// Indices above this are refused: an index is a small list position, and a
// typing slip such as a[4000000000] must not try to create billions of nodes.
constexpr std::size_t kMaxIndex = 65535;

// A path created in one go names one setting, so it is held to what the
// configuration file allows one key and one file: at most
// config::kMaxKeyLength characters and 262144 new entries. Without them a short text such as
// a[65535][65535]... adds 65536 nodes a step, and a long dotted one builds names of quadratic size.
constexpr std::size_t kMaxPathLength = config::kMaxKeyLength;
constexpr std::size_t kMaxNewEntries = 262144;

[[noreturn]] void throwNoneHasNoValue() {
    throw std::invalid_argument(msg::kNoneHasNoValue);
}

// The key as the configuration file writes it: "root.config.lsc.max_gain"
// -> "lsc.max_gain".
std::string keyOfNode(const std::string& nodeName) {
    std::string key = nodeName;
    for (const char* prefix : {"root.", "config."})
        if (key.compare(0, std::strlen(prefix), prefix) == 0)
            key.erase(0, std::strlen(prefix));
    return key;
}

// The conversion error keeps its library text; the detail names the key and
// the text that did not convert.
[[noreturn]] void throwNotConvertible(const std::string& nodeName, const std::string& text,
                                      const std::type_info& target, const char* expected) {
    throw DetailedError<boost::bad_lexical_cast>(
        keyOfNode(nodeName) + " = " + text + ": not " + expected, typeid(std::string), target);
}

std::int32_t toInteger(const std::string& nodeName, const std::string& text) {
    std::int32_t value = 0;
    if (!parseIntegerText(text, value))
        throwNotConvertible(nodeName, text, typeid(int), "a whole number (32 bits)");
    return value;
}

// One step of a dotted path: a name, or an index when `isIndex`.
struct PathStep {
    bool isIndex = false;
    std::string name;
    std::size_t index = 0;
};

[[noreturn]] void throwBadPath(const std::string& path) {
    throw std::invalid_argument(msg::kBadPathPrefix + path);
}

// As the configuration grammar's names (block names may hold a dash).
bool isNameChar(char c) {
    return (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') || c == '_' ||
           c == '-';
}

// Reads the next step at `pos`; false at the end of the path.
bool nextStep(const std::string& path, std::size_t& pos, PathStep& step) {
    if (pos == path.size())
        return false;
    const bool first = pos == 0;
    if (path[pos] == '[') {
        const std::size_t close = path.find(']', pos);
        if (close == std::string::npos || close == pos + 1)
            throwBadPath(path);
        std::size_t index = 0;
        for (std::size_t i = pos + 1; i < close; ++i) {
            if (path[i] < '0' || path[i] > '9')
                throwBadPath(path);
            // Saturate: anything this large is refused by child() or not found by find().
            index =
                index > kMaxIndex ? index : index * 10 + static_cast<std::size_t>(path[i] - '0');
        }
        step.isIndex = true;
        step.index = index;
        pos = close + 1;
        return true;
    }
    if (!first) {
        if (path[pos] != '.')
            throwBadPath(path);
        ++pos;
    }
    const std::size_t start = pos;
    while (pos < path.size() && isNameChar(path[pos]))
        ++pos;
    if (pos == start)
        throwBadPath(path);
    step.isIndex = false;
    step.name.assign(path, start, pos - start);
    return true;
}

template <typename Node, typename Descend>
Node& walkPath(Node& start, const std::string& path, Descend descend) {
    if (path.empty())
        throwBadPath(path);
    Node* node = &start;
    std::size_t pos = 0;
    PathStep step;
    while (nextStep(path, pos, step))
        node = &descend(*node, step);
    return *node;
}

} // namespace

// ---- config_node ----------------------------------------------------------

const config_node& config_node::find_path(const std::string& path) const {
    return walkPath(*this, path,
                    [](const config_node& node, const PathStep& step) -> const config_node& {
                        return step.isIndex ? node.find(step.index) : node.find(step.name);
                    });
}

config_node& config_node::child_path(const std::string& path) {
    if (path.size() > kMaxPathLength)
        throw std::invalid_argument(msg::kPathTooLongPrefix + path.substr(0, kMaxPathLength));
    std::size_t newEntries = 0;
    return walkPath(*this, path, [&](config_node& node, const PathStep& step) -> config_node& {
        // Counted before anything is created; an index beyond the limit is
        // refused by child() itself.
        if (step.isIndex ? step.index >= node.size() && step.index <= kMaxIndex
                         : !node.find(step.name).valid())
            newEntries += step.isIndex ? step.index + 1 - node.size() : 1;
        if (newEntries > kMaxNewEntries)
            throw std::out_of_range(msg::kPathTooManyEntriesPrefix + path);
        return step.isIndex ? node.child(step.index) : node.child(step.name);
    });
}

// ---- config_node_impl -----------------------------------------------------

config_node_impl::config_node_impl(std::string name) : name_(std::move(name)) {
}

// Releases the subtree without recursion, so that however deep a tree grows,
// destroying it cannot overflow the stack.
config_node_impl::~config_node_impl() {
    std::vector<std::shared_ptr<config_node_impl>> pending;
    auto adopt = [&pending](config_node_impl& node) {
        for (auto& entry : node.named_)
            pending.push_back(std::move(entry.second));
        node.named_.clear();
        for (auto& child : node.indexed_)
            pending.push_back(std::move(child));
        node.indexed_.clear();
    };
    adopt(*this);
    while (!pending.empty()) {
        std::shared_ptr<config_node_impl> node = std::move(pending.back());
        pending.pop_back();
        if (node && node.use_count() == 1)
            adopt(*node);
    }
}

void config_node_impl::checkInitialized() const {
    if (!initialized_)
        throw std::invalid_argument(msg::kNotInitializedPrefix + name_ +
                                    msg::kNotInitializedSuffix);
}

const std::string& config_node_impl::as_string() const {
    checkInitialized();
    return value_;
}

bool config_node_impl::as_bool() const {
    checkInitialized();
    return toInteger(name_, value_) != 0;
}

float config_node_impl::as_float() const {
    checkInitialized();
    float value = 0.0f;
    if (!parseFloatText(value_, value))
        throwNotConvertible(name_, value_, typeid(float), "a number");
    return value;
}

unsigned char config_node_impl::as_uint8() const {
    checkInitialized();
    return static_cast<unsigned char>(static_cast<std::uint32_t>(toInteger(name_, value_)) & 0xFFu);
}

int config_node_impl::as_int() const {
    checkInitialized();
    return toInteger(name_, value_);
}

config_node& config_node_impl::child(const std::string& name) {
    auto found = named_.find(name);
    if (found == named_.end())
        found = named_.emplace(name, std::make_shared<config_node_impl>(name_ + "." + name)).first;
    return *found->second;
}

const config_node& config_node_impl::find(const std::string& name) const {
    const auto found = named_.find(name);
    if (found == named_.end())
        return config_node_none::instance();
    return *found->second;
}

config_node& config_node_impl::child(std::size_t index) {
    if (index > kMaxIndex)
        throw std::out_of_range(msg::kIndexTooLargePrefix + std::to_string(index) +
                                msg::kIndexTooLargeMiddle + name_ + msg::kIndexTooLargeSuffix);
    if (index >= indexed_.size()) {
        // No exact reserve here: lists grow one index at a time, and
        // push_back's geometric growth keeps that linear.
        for (std::size_t i = indexed_.size(); i <= index; ++i)
            indexed_.push_back(
                std::make_shared<config_node_impl>(name_ + "[" + std::to_string(i) + "]"));
    }
    return *indexed_[index];
}

const config_node& config_node_impl::find(std::size_t index) const {
    if (index >= indexed_.size())
        return config_node_none::instance();
    return *indexed_[index];
}

// Depth first with an explicit stack, so that a deep tree cannot overflow
// the call stack.
void config_node_impl::print(std::ostream& out) const {
    std::vector<const config_node_impl*> pending{this};
    while (!pending.empty()) {
        const config_node_impl* node = pending.back();
        pending.pop_back();
        out << node->name_;
        if (node->value_.empty())
            out << " = <empty>\n";
        else
            out << " = " << (node->isDefault_ ? "*" : "") << node->value_ << '\n';
        for (auto it = node->indexed_.rbegin(); it != node->indexed_.rend(); ++it)
            pending.push_back(it->get());
        for (auto it = node->named_.rbegin(); it != node->named_.rend(); ++it)
            pending.push_back(it->second.get());
    }
}

void config_node_impl::set(const std::string& value, bool isDefault) {
    value_ = value;
    isDefault_ = isDefault;
    initialized_ = true;
}

// ---- config_node_none -----------------------------------------------------

config_node_none& config_node_none::instance() {
    static config_node_none none;
    return none;
}

const std::string& config_node_none::as_string() const {
    throwNoneHasNoValue();
}
bool config_node_none::as_bool() const {
    throwNoneHasNoValue();
}
float config_node_none::as_float() const {
    throwNoneHasNoValue();
}
unsigned char config_node_none::as_uint8() const {
    throwNoneHasNoValue();
}
int config_node_none::as_int() const {
    throwNoneHasNoValue();
}

void config_node_none::print(std::ostream& out) const {
    out << name_ << '\n';
}

// ---- helpers --------------------------------------------------------------

std::string config_relative_path(const config_node& configNode, const config_node& parameter) {
    const std::string& base = configNode.name();
    const std::string& full = parameter.name();
    if (full.size() > base.size() && full.compare(0, base.size(), base) == 0 &&
        full[base.size()] == '.')
        return full.substr(base.size() + 1);
    return full;
}

} // namespace config
