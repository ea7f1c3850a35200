#include "json/json_value.h"

#include <algorithm>

namespace kutils::json {

/// The containers of a document that is being taken apart, linked through themselves.
template <class Config>
class Value_impl<Config>::Wreckage {
public:
    explicit Wreckage(Value_impl& value) noexcept { take(value); }

    bool clear_one() noexcept
    {
        if (objects_) {
            return clear_object(), true;
        }
        if (arrays_) {
            return clear_array(), true;
        }
        return false;
    }

private:
    static bool is_container(Value_impl const& value) noexcept { return value.type_ <= Value_type::array; }

    template <class Container>
    static void push(Box<Container>*& list, Box<Container>* box) noexcept
    {
        box->next = list;
        list = box;
    }

    template <class Container>
    static Box<Container>* pop(Box<Container>*& list) noexcept
    {
        return std::exchange(list, list->next);
    }

    void take(Value_impl& value) noexcept
    {
        if (value.type_ == Value_type::object) {
            push(objects_, value.payload_.object);
        } else {
            push(arrays_, value.payload_.array);
        }
        value.type_ = Value_type::null;
    }

    void clear_object() noexcept
    {
        Box<Object>* const box = pop(objects_);
        for (auto& member : box->content) {
            if (is_container(member.second)) {
                take(member.second);
            }
        }
        delete box;
    }

    // One element at a time: a long array whose elements were all taken first would be walked twice, cold both times.
    void clear_array() noexcept
    {
        Array& array = arrays_->content;
        while (!array.empty() && !is_container(array.back())) {
            array.pop_back();
        }
        if (array.empty()) {
            delete pop(arrays_);
            return;
        }
        Value_impl last(std::move(array.back()));
        array.pop_back();
        take(last);
    }

    Box<Object>* objects_ = nullptr;
    Box<Array>* arrays_ = nullptr;
};

template <class Config>
Value_impl<Config>::Value_impl(Value_impl const& other) : Value_impl()
{
    std::vector<CopyTask> pending;
    copy_content({&other, this}, pending);
    while (!pending.empty()) {
        CopyTask const task = pending.back();
        pending.pop_back();
        copy_elements(task, pending);
    }
}

template <class Config>
Value_impl<Config>::Value_impl(Object object)
{
    payload_.object = new Box<Object>{std::move(object)};
    type_ = Value_type::object;
}

template <class Config>
Value_impl<Config>::Value_impl(Array array)
{
    payload_.array = new Box<Array>{std::move(array)};
    type_ = Value_type::array;
}

template <class Config>
Value_impl<Config>::Value_impl(String string)
{
    payload_.string = new String(std::move(string));
    type_ = Value_type::string;
}

template <class Config>
Value_impl<Config>::Value_impl(typename String::value_type const* string)
    : Value_impl(string ? String(string) : String())
{
}

template <class Config>
double Value_impl<Config>::get_real() const
{
    if (type_ == Value_type::integer) {
        return is_uint64_ ? static_cast<double>(get_uint64()) : static_cast<double>(get_int64());
    }
    check_type(Value_type::real);
    return payload_.real;
}

template <class Config>
void Value_impl<Config>::throw_type_error(Value_type expected) const
{
    auto const number = [](Value_type type) { return std::to_string(static_cast<std::int32_t>(type)); };
    throw ValueError("value type is " + number(type_) + " not " + number(expected));
}

template <class Config>
void Value_impl<Config>::destroy() noexcept
{
    if (type_ == Value_type::string) {
        delete payload_.string;
        return;
    }
    Wreckage wreckage(*this);
    while (wreckage.clear_one()) {
    }
}

template <class Config>
void Value_impl<Config>::copy_content(CopyTask task, std::vector<CopyTask>& pending)
{
    switch (task.from->type_) {
    case Value_type::object: *task.to = Object(); break;
    case Value_type::array: *task.to = Array(); break;
    case Value_type::string: *task.to = task.from->get_string(); return;
    default:
        task.to->type_ = task.from->type_;
        task.to->is_uint64_ = task.from->is_uint64_;
        task.to->payload_ = task.from->payload_;
        return;
    }
    pending.push_back(task);
}

template <class Config>
void Value_impl<Config>::copy_elements(CopyTask task, std::vector<CopyTask>& pending)
{
    if (task.from->type_ == Value_type::array) {
        Array& array = task.to->get_array();
        array.resize(task.from->get_array().size());
        auto to = array.begin();
        for (Value_impl const& from : task.from->get_array()) {
            copy_content({&from, &*to++}, pending);
        }
        return;
    }
    Object& object = task.to->get_object();
    for (auto const& [key, from] : task.from->get_object()) {
        copy_content({&from, &object.emplace_hint(object.end(), key, Value_impl())->second}, pending);
    }
}

template <class Config>
bool Value_impl<Config>::equals(Value_impl const& other) const
{
    std::vector<ComparisonTask> pending;
    if (!same_content({this, &other}, pending)) {
        return false;
    }
    while (!pending.empty()) {
        ComparisonTask const task = pending.back();
        pending.pop_back();
        if (!same_elements(task, pending)) {
            return false;
        }
    }
    return true;
}

template <class Config>
bool Value_impl<Config>::same_content(ComparisonTask task, std::vector<ComparisonTask>& pending)
{
    auto const& [a, b] = task;
    if (a->type_ != b->type_) {
        return false;
    }
    switch (a->type_) {
    case Value_type::object:
    case Value_type::array: pending.push_back(task); return true;
    case Value_type::string: return a->get_string() == b->get_string();
    case Value_type::boolean: return a->get_bool() == b->get_bool();
    case Value_type::integer:
        return a->get_uint64() == b->get_uint64() && (a->is_uint64_ == b->is_uint64_ || a->get_int64() >= 0);
    case Value_type::real: return a->payload_.real == b->payload_.real;
    default: return true;
    }
}

template <class Config>
bool Value_impl<Config>::same_elements(ComparisonTask task, std::vector<ComparisonTask>& pending)
{
    if (task.a->type_ == Value_type::array) {
        auto const same = [&](Value_impl const& a, Value_impl const& b) { return same_content({&a, &b}, pending); };
        Array const& a = task.a->get_array();
        Array const& b = task.b->get_array();
        return std::equal(a.begin(), a.end(), b.begin(), b.end(), same);
    }
    auto const same = [&](auto const& a, auto const& b) {
        return a.first == b.first && same_content({&a.second, &b.second}, pending);
    };
    Object const& a = task.a->get_object();
    Object const& b = task.b->get_object();
    return std::equal(a.begin(), a.end(), b.begin(), b.end(), same);
}

template class Value_impl<Config_map<std::wstring>>;

} // namespace kutils::json
