#include "tests/wbem/Items.h"

#include <algorithm>
#include <stdexcept>

namespace marlo::test {

const char* const itemsMof = R"(
#pragma namespace ("root/test")
[Description("A thing in memory.")]
class TEST_Item {
    [Key, Description("Which one.")] string Name;
    [Key] uint16 Number;
    [Write] string Note;
    [Write] uint32 Level = 3;
    [Write] string Tags[];
    sint8 Balance;
    boolean Good;
    [Write] datetime When;
    [EmbeddedInstance("TEST_Part")] string Part;

    uint32 Echo([In] string Text, [In] uint8 Small, [In] sint64 Big, [In] boolean Truth, [In] datetime Moment,
                [In] real64 Real, [In] char16 Letter, [In] string Texts[], [In] uint16 Numbers[],
                [In] TEST_Item REF Other, [In, EmbeddedInstance("TEST_Part")] string Part,
                [In(false), Out] string TextOut, [In(false), Out] uint8 SmallOut, [In(false), Out] sint64 BigOut,
                [In(false), Out] boolean TruthOut, [In(false), Out] datetime MomentOut, [In(false), Out] real64 RealOut,
                [In(false), Out] char16 LetterOut, [In(false), Out] string TextsOut[],
                [In(false), Out] uint16 NumbersOut[], [In(false), Out] TEST_Item REF OtherOut,
                [In(false), Out, EmbeddedInstance("TEST_Part")] string PartOut);
    uint32 Explode();
    [Static] string Hello();
    uint32 Unserved();
};
class TEST_SubItem : TEST_Item {
    string Extra;
    [Override("Note"), Description("Noted by a subclass."), Write] string Note;
};
[Association]
class TEST_Link {
    [Key] TEST_Item REF Parent;
    [Key] TEST_Item REF Child;
    string Kind;
};
class TEST_Part {
    string Label;
    uint8 Weight;
};
class TEST_Stream {
    [Key] uint32 Index;
    string Filling;
};
class TEST_Unserved { [Key] string Id; };
)";

namespace {

ObjectPath pathOf(const std::string& className, const std::string& name, std::uint64_t number) {
    return {
        "", "root/test", className, {{"Name", Value::string(name)}, {"Number", Value::uint(CMPI_uint16, number)}}};
}

Instance makeItem(const std::string& className, const std::string& name, std::uint64_t number) {
    Instance item{pathOf(className, name, number), {}};
    item.properties = item.path.keys;
    item.properties.push_back({"Note", Value::string("about " + name + " <&> \"it\"")});
    item.properties.push_back({"Level", Value::uint(CMPI_uint32, number * 10)});
    item.properties.push_back(
        {"Tags", {CMPI_stringA, Value::Array{Value::string("one"), Value::null(CMPI_string), Value::string("")}}});
    item.properties.push_back({"Balance", Value::sint(CMPI_sint8, -5)});
    item.properties.push_back({"Good", Value::boolean(true)});
    item.properties.push_back({"When", {CMPI_dateTime, DateTime{"20250102030405.000000+060"}}});
    return item;
}

Value reference(const ObjectPath& path) {
    return {CMPI_ref, std::make_shared<const ObjectPath>(path)};
}

Instance makeLink(const ObjectPath& parent, const ObjectPath& child) {
    Instance link{{"", "root/test", "TEST_Link", {{"Parent", reference(parent)}, {"Child", reference(child)}}}, {}};
    link.properties = link.path.keys;
    link.properties.push_back({"Kind", Value::string("next")});
    return link;
}

Status notFound(const ObjectPath& path) {
    return {CMPI_RC_ERR_NOT_FOUND, "there is no " + path.toString(), {}};
}

} // namespace

Items::Items()
    : _items{makeItem("TEST_Item", "a", 1), makeItem("TEST_Item", "b", 2), makeItem("TEST_SubItem", "c", 3)} {
    _items[2].properties.push_back({"Extra", Value::string("more")});
}

std::vector<std::string> Items::classes() const {
    return {"TEST_Item", "TEST_SubItem", "TEST_Link", "TEST_Stream"};
}

Status Items::stream(const ObjectManager::InstanceSink& sink) const {
    for (std::size_t index = 1; index <= streamLength; ++index) {
        if (onStream) {
            onStream(index);
        }
        if (index == streamFailsAt) {
            return {CMPI_RC_ERR_FAILED, "broke off at 100 %", {}};
        }
        Instance instance{{"", "root/test", "TEST_Stream", {{"Index", Value::uint(CMPI_uint32, index)}}}, {}};
        instance.properties = instance.path.keys;
        instance.properties.push_back({"Filling", Value::string(std::string(200, 'x'))});
        sink(std::move(instance));
    }
    return {};
}

Status Items::enumerate(const Class& definition, const ObjectManager::InstanceSink& sink) {
    if (definition.name == "TEST_Stream") {
        return stream(sink);
    }
    std::vector<Instance> items;
    {
        const std::lock_guard lock(_mutex);
        items = _items;
    }
    for (const Instance& item : items) {
        if (item.path.className == definition.name) {
            sink(Instance(item));
        } else if (definition.name == "TEST_Link" && item.path.keys != items[0].path.keys) {
            sink(makeLink(items[0].path, item.path));
        }
    }
    return {};
}

Status Items::create(const Class& definition, const Instance& instance, ObjectPath& created) {
    if (definition.name != "TEST_Item") {
        return BuiltIn::create(definition, instance, created);
    }
    if (instance.path.keys.size() < 2) {
        return {CMPI_RC_ERR_INVALID_PARAMETER, "an item needs Name and Number", {}};
    }
    const std::lock_guard lock(_mutex);
    const auto found = std::find_if(_items.begin(), _items.end(),
                                    [&](const Instance& item) { return item.path.keys == instance.path.keys; });
    if (found != _items.end()) {
        return {CMPI_RC_ERR_ALREADY_EXISTS, "there is " + found->path.toString() + " already", {}};
    }
    _items.push_back(instance);
    created = instance.path;
    return {};
}

Status Items::modify(const Class& /*definition*/, const Instance& instance, const std::vector<std::string>& names) {
    const std::lock_guard lock(_mutex);
    const auto found = std::find_if(_items.begin(), _items.end(),
                                    [&](const Instance& item) { return item.path.keys == instance.path.keys; });
    if (found == _items.end()) {
        return notFound(instance.path);
    }
    for (const std::string& name : names) {
        const NamedValue* given = findName(instance.properties, name);
        std::erase_if(found->properties, [&name](const NamedValue& value) { return equalNames(value.name, name); });
        if (given != nullptr) {
            found->properties.push_back(*given);
        }
    }
    return {};
}

Status Items::remove(const Class& /*definition*/, const ObjectPath& path) {
    const std::lock_guard lock(_mutex);
    const auto removed = std::erase_if(_items, [&path](const Instance& item) { return item.path.keys == path.keys; });
    return removed == 0 ? notFound(path) : Status{};
}

Status Items::invoke(const Class& definition, const ObjectPath& path, const Method& method,
                     const std::vector<NamedValue>& arguments, MethodAnswer& answer) {
    if (method.name == "Explode") {
        throw std::runtime_error("the method exploded");
    }
    if (method.name == "Hello") {
        answer.returned = Value::string("hello");
        return {};
    }
    if (method.name != "Echo") {
        return BuiltIn::invoke(definition, path, method, arguments, answer);
    }
    answer.returned = Value::uint(CMPI_uint32, arguments.size());
    for (const NamedValue& argument : arguments) {
        answer.out.push_back({argument.name + "Out", argument.value});
    }
    return {};
}

} // namespace marlo::test
