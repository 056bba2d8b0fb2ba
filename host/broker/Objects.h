/**
 * @file
 * What stands behind the CMPI handles.
 *
 * A handle's `hdl` points at the object, so that an operation finds its object in any copy of the handle and whatever
 * function table the copy carries. Every object lies in an arena: that of the call that created it, or, for what
 * `clone` returns, one of its own, which ends when the clone is released.
 */
#pragma once

#include "host/broker/Arena.h"
#include "host/broker/NamedList.h"

#include <cstdint>
#include <memory>
#include <string_view>

#include <cmpift.h>

namespace marlo::filter {
class Filter;
}

namespace marlo::broker {

class BrokerState;

/** The values are read from foreign memory when a caller mixes handles up, so none of them is likely there. */
enum class Kind : std::uint32_t {
    string = 0xC0DE5701,
    array,
    dateTime,
    objectPath,
    instance,
    args,
    context,
    enumeration,
    result,
    error,
    broker,
    selectExp,
};

/** What all objects begin with. */
class ObjectBase {
  public:
    ObjectBase(Kind kind, Arena* arena, std::uint32_t number = 0) : _arena(arena), _kind(kind), _number(number) {}

    [[nodiscard]] Kind kind() const { return _kind; }

    /** Only of what lies in one: not of results and brokers, which the object manager holds. */
    [[nodiscard]] Arena& arena() const { return *_arena; }

    /** True for what `clone` returned, which lives until released. */
    [[nodiscard]] bool isClone() const { return _arena != nullptr && _arena->root() == this; }

    /** The object behind any encapsulated handle, or null where there is none. */
    static ObjectBase* of(const void* handle);

  protected:
    /** For the object's own use: it lies where there would be nothing, and there are many strings. */
    [[nodiscard]] std::uint32_t number() const { return _number; }

  private:
    Arena* _arena;
    Kind _kind;
    std::uint32_t _number;
};

/** The layout that all encapsulated types share. */
struct AnyHandle {
    const void* hdl;
    const void* ft;
};

inline ObjectBase* ObjectBase::of(const void* handle) {
    const auto* any = static_cast<const AnyHandle*>(handle);
    return any == nullptr ? nullptr : static_cast<ObjectBase*>(const_cast<void*>(any->hdl));
}

template <typename HandleType, Kind KindValue>
class Object : public ObjectBase {
  public:
    using Handle = HandleType;

    Object(const Object&) = delete;
    Object& operator=(const Object&) = delete;

    Handle handle;

    static constexpr Kind kindValue = KindValue;

  protected:
    template <typename Table>
    Object(Arena* arena, const Table& table, std::uint32_t number = 0)
        : ObjectBase(KindValue, arena, number), handle{this, &table} {}

    ~Object() = default;
};

/** The object of type T behind a handle; null for a null handle, a released one or one of another type. */
template <typename T>
T* objectOf(const typename T::Handle* handle) {
    ObjectBase* base = ObjectBase::of(handle);
    return base != nullptr && base->kind() == T::kindValue ? static_cast<T*>(base) : nullptr;
}

extern const CMPIStringFT stringTable;
extern const CMPIArrayFT arrayTable;
extern const CMPIDateTimeFT dateTimeTable;
extern const CMPIObjectPathFT objectPathTable;
extern const CMPIInstanceFT instanceTable;
extern const CMPIArgsFT argsTable;
extern const CMPIContextFT contextTable;
extern const CMPIEnumerationFT enumerationTable;
extern const CMPIErrorFT errorTable;
extern const CMPISelectExpFT selectExpTable;

/** Immutable, so objects of one arena share it. */
class StringObject final : public Object<CMPIString, Kind::string> {
  public:
    static StringObject* make(Arena& arena, std::string_view text);

    /** For names, which recur in every object of a call: mostly one string for all of them. */
    static StringObject* makeName(Arena& arena, std::string_view name);

    /** For values, many of which are the same in every instance that a call makes. */
    static StringObject* makeValue(Arena& arena, std::string_view value);

    [[nodiscard]] std::string_view text() const { return {characters(), number()}; }

    /** Zero-terminated; they follow the object. */
    [[nodiscard]] const char* characters() const { return reinterpret_cast<const char*>(this + 1); }

    /** Itself where it lies in `target` already. */
    StringObject* copyTo(Arena& target);

  private:
    friend class Arena;

    StringObject(Arena& arena, std::uint32_t length) : Object(&arena, stringTable, length) {}

    static StringObject* findOrMake(Arena& arena, StringObject** known, std::string_view text);
};

class ArrayObject final : public Object<CMPIArray, Kind::array> {
  public:
    /** All elements NULL. */
    static ArrayObject* make(Arena& arena, CMPICount count, CMPIType elementType);

    ArrayObject* copyTo(Arena& target) const;

    CMPIData* elements = nullptr;
    CMPICount count = 0;
    CMPIType elementType = CMPI_null; ///< CMPI_string for CMPI_chars

  private:
    friend class Arena;

    explicit ArrayObject(Arena& arena) : Object(&arena, arrayTable) {}
};

/** Immutable. */
class DateTimeObject final : public Object<CMPIDateTime, Kind::dateTime> {
  public:
    static constexpr std::size_t textLength = 25;

    /** `text` has the 25 characters of DSP0004. */
    static DateTimeObject* make(Arena& arena, std::string_view text, std::uint64_t binary, bool interval);

    [[nodiscard]] std::string_view text() const { return {_text, textLength}; }

    DateTimeObject* copyTo(Arena& target);

    std::uint64_t binary = 0; ///< microseconds, since 1970 in UTC or of the interval
    bool interval = false;

  private:
    friend class Arena;

    explicit DateTimeObject(Arena& arena) : Object(&arena, dateTimeTable) {}

    char _text[textLength + 1] = {};
};

class ObjectPathObject final : public Object<CMPIObjectPath, Kind::objectPath> {
  public:
    /** Few classes have more keys, and there is a list of them for every path. */
    static constexpr CMPICount ordinaryKeys = 4;

    static ObjectPathObject* make(Arena& arena, const BrokerState& broker, std::string_view nameSpace,
                                  std::string_view className);

    ObjectPathObject* copyTo(Arena& target) const;

    const BrokerState* broker;
    StringObject* host = nullptr; ///< null as long as none was set
    StringObject* nameSpace = nullptr;
    StringObject* className = nullptr;
    NamedList keys;

  private:
    friend class Arena;

    ObjectPathObject(Arena& arena, const BrokerState& brokerState)
        : Object(&arena, objectPathTable), broker(&brokerState), keys(arena, ordinaryKeys) {}
};

class InstanceObject final : public Object<CMPIInstance, Kind::instance> {
  public:
    /** Takes a copy of the path. */
    static InstanceObject* make(Arena& arena, const ObjectPathObject& path);

    InstanceObject* copyTo(Arena& target) const;

    /** A copy of the path, with the keys it lacks taken from the key properties that the class is known to have. */
    ObjectPathObject* completePath(Arena& target) const;

    ObjectPathObject* path = nullptr; ///< never handed out
    NamedList properties;
    NamedList filter; ///< names alone
    bool filtered = false;

  private:
    friend class Arena;

    explicit InstanceObject(Arena& arena) : Object(&arena, instanceTable), properties(arena), filter(arena) {}
};

class ArgsObject final : public Object<CMPIArgs, Kind::args> {
  public:
    static ArgsObject* make(Arena& arena) { return arena.make<ArgsObject>(arena); }

    ArgsObject* copyTo(Arena& target) const;

    NamedList values;

  private:
    friend class Arena;

    explicit ArgsObject(Arena& arena) : Object(&arena, argsTable), values(arena) {}
};

class ContextObject final : public Object<CMPIContext, Kind::context> {
  public:
    static ContextObject* make(Arena& arena) { return arena.make<ContextObject>(arena); }

    ContextObject* copyTo(Arena& target) const;

    NamedList entries;
    BrokerState* preparedBy = nullptr; ///< set for a context that waits for its thread

  private:
    friend class Arena;

    explicit ContextObject(Arena& arena) : Object(&arena, contextTable), entries(arena) {}
};

/** Instances or paths, read once from front to back. */
class EnumerationObject final : public Object<CMPIEnumeration, Kind::enumeration> {
  public:
    static EnumerationObject* make(Arena& arena, CMPIType elementType);

    EnumerationObject* copyTo(Arena& target) const;

    void add(const CMPIData& element);

    CMPIType elementType;
    CMPIData* elements = nullptr;
    CMPICount count = 0;
    CMPICount next = 0;

  private:
    friend class Arena;

    EnumerationObject(Arena& arena, CMPIType type) : Object(&arena, enumerationTable), elementType(type) {}

    CMPICount _capacity = 0;
};

class ErrorObject final : public Object<CMPIError, Kind::error> {
  public:
    static ErrorObject* make(Arena& arena) { return arena.make<ErrorObject>(arena); }

    ErrorObject* copyTo(Arena& target) const;

    CMPIErrorType type = UnknownErrorType;
    CMPIErrorSeverity severity = ErrorSeverityUnknown;
    CMPIErrorProbableCause cause = ErrorProbCauseUnknown;
    CMPIErrorSrcFormat sourceFormat = CMPIErrorSrcFormatUnknown;
    CMPIrc code = CMPI_RC_OK;
    StringObject* otherType = nullptr;
    StringObject* owningEntity = nullptr;
    StringObject* messageId = nullptr;
    StringObject* message = nullptr;
    StringObject* causeDescription = nullptr;
    StringObject* source = nullptr;
    StringObject* otherSourceFormat = nullptr;
    StringObject* codeDescription = nullptr;
    ArrayObject* recommendedActions = nullptr;
    ArrayObject* messageArguments = nullptr;

  private:
    friend class Arena;

    explicit ErrorObject(Arena& arena) : Object(&arena, errorTable) {}
};

/** Immutable. */
class SelectExpObject final : public Object<CMPISelectExp, Kind::selectExp> {
  public:
    static SelectExpObject* make(Arena& arena, const BrokerState& broker,
                                 std::shared_ptr<const filter::Filter> filter);

    SelectExpObject* copyTo(Arena& target) const;

    const BrokerState* broker;
    const filter::Filter* filter; ///< kept by the arena

  private:
    friend class Arena;

    SelectExpObject(Arena& arena, const BrokerState& brokerState, const filter::Filter* kept)
        : Object(&arena, selectExpTable), broker(&brokerState), filter(kept) {}
};

} // namespace marlo::broker
