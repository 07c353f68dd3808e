#pragma once
// The configuration tree: named, text-valued nodes with named and indexed
// children. Writers navigate with the creating lookups (child, operator[]),
// readers with the non-creating ones (find), which answer the shared null
// node, config_node_none, for anything missing.

#include <cstddef>
#include <map>
#include <memory>
#include <ostream>
#include <string>
#include <vector>

namespace config {

class config_node {
public:
    virtual ~config_node() = default;

    virtual bool valid() const = 0;
    virtual const std::string& as_string() const = 0;
    virtual bool as_bool() const = 0;
    virtual float as_float() const = 0;
    virtual unsigned char as_uint8() const = 0;
    virtual int as_int() const = 0;
    virtual std::size_t size() const = 0;
    virtual config_node& child(const std::string& name) = 0;
    virtual config_node& operator[](const std::string& name) = 0;
    virtual const config_node& find(const std::string& name) const = 0;
    virtual config_node& child(std::size_t index) = 0;
    virtual config_node& operator[](std::size_t index) = 0;
    virtual const config_node& find(std::size_t index) const = 0;
    virtual void print(std::ostream& out) const = 0;

    // Assigns a value. `isDefault` marks values written by the parameter
    // table. No effect on the null node.
    virtual void set(const std::string& value, bool isDefault = false) = 0;
    virtual const std::string& name() const = 0;
    virtual bool is_default() const = 0;
    virtual bool initialized() const = 0;

    // Dotted path relative to the tree ("lsc.max_gain", "apply_lsc.ccm[1][2]"):
    // each "." step descends by name, each "[n]" by index. find_path never creates.
    const config_node& find_path(const std::string& path) const;
    config_node& child_path(const std::string& path);
};

class config_node_impl : public config_node {
public:
    explicit config_node_impl(std::string name);
    ~config_node_impl() override;

    bool valid() const override { return true; }
    const std::string& as_string() const override;
    bool as_bool() const override;
    float as_float() const override;
    unsigned char as_uint8() const override;
    int as_int() const override;
    std::size_t size() const override { return indexed_.size(); }
    config_node& child(const std::string& name) override;
    config_node& operator[](const std::string& name) override { return child(name); }
    const config_node& find(const std::string& name) const override;
    config_node& child(std::size_t index) override;
    config_node& operator[](std::size_t index) override { return child(index); }
    const config_node& find(std::size_t index) const override;
    void print(std::ostream& out) const override;

    void set(const std::string& value, bool isDefault = false) override;
    const std::string& name() const override { return name_; }
    bool is_default() const override { return isDefault_; }
    bool initialized() const override { return initialized_; }

    // Named children in byte-wise order, then indexed children.
    const std::map<std::string, std::shared_ptr<config_node_impl>>& namedChildren() const {
        return named_;
    }
    const std::vector<std::shared_ptr<config_node_impl>>& indexedChildren() const {
        return indexed_;
    }

private:
    void checkInitialized() const;

    std::string name_;
    std::string value_;
    bool isDefault_ = false;
    bool initialized_ = false;
    std::map<std::string, std::shared_ptr<config_node_impl>> named_;
    std::vector<std::shared_ptr<config_node_impl>> indexed_;
};

class config_node_none : public config_node {
public:
    static config_node_none& instance();

    bool valid() const override { return false; }
    const std::string& as_string() const override;
    bool as_bool() const override;
    float as_float() const override;
    unsigned char as_uint8() const override;
    int as_int() const override;
    std::size_t size() const override { return 0; }
    config_node& child(const std::string&) override { return *this; }
    config_node& operator[](const std::string&) override { return *this; }
    const config_node& find(const std::string&) const override { return *this; }
    config_node& child(std::size_t) override { return *this; }
    config_node& operator[](std::size_t) override { return *this; }
    const config_node& find(std::size_t) const override { return *this; }
    void print(std::ostream& out) const override;

    void set(const std::string&, bool = false) override {}
    const std::string& name() const override { return name_; }
    bool is_default() const override { return false; }
    bool initialized() const override { return false; }

private:
    config_node_none() = default;
    std::string name_ = "none";
};

// The path of a node relative to the "config" node, as messages name it:
// "root.config.lsc.max_gain" -> "lsc.max_gain".
std::string config_relative_path(const config_node& configNode, const config_node& parameter);

} // namespace config
