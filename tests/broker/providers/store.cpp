/**
 * @file
 * Providers that need the whole of the broker: one of items in memory that are created, changed and deleted, one of
 * pairs of items, one whose method asks for every operation on them, and some with less of a function table.
 */
#include <array>
#include <map>
#include <mutex>
#include <stdexcept>
#include <string>

#include <cmpimacs.h>

namespace {

const CMPIBroker* broker;
std::mutex mutex; ///< guards items
std::map<std::string, CMPIUint16> items;

std::string textOf(const CMPIString* text) {
    return text == nullptr ? "NULL" : CMGetCharPtr(text);
}

CMPIStatus answer(CMPIrc code, const char* message = nullptr) {
    return {code, message == nullptr ? nullptr : CMNewString(broker, message, nullptr)};
}

std::string textOf(const CMPIData& data) {
    return (data.state & CMPI_nullValue) != 0 ? "" : textOf(data.value.string);
}

std::string idOf(const CMPIObjectPath* path) {
    return textOf(CMGetKey(path, "Id", nullptr));
}

CMPIObjectPath* itemPath(const std::string& id) {
    CMPIObjectPath* path = CMNewObjectPath(broker, "root/test", "Test_Item", nullptr);
    CMAddKey(path, "Id", id.c_str(), CMPI_chars);
    return path;
}

CMPIInstance* makeItem(const CMPIContext* context, const std::string& id, CMPIUint16 count) {
    CMPIInstance* item = CMNewInstance(broker, itemPath(id), nullptr);
    const CMPIData principal = CMGetContextEntry(context, CMPIPrincipal, nullptr);
    CMSetProperty(item, "Id", id.c_str(), CMPI_chars);
    CMSetProperty(item, "Count", &count, CMPI_uint16);
    CMSetProperty(item, "Principal", textOf(principal).c_str(), CMPI_chars);
    return item;
}

CMPIStatus endInstances(CMPIInstanceMI*, const CMPIContext*, CMPIBoolean) {
    const std::lock_guard lock(mutex);
    items.clear();
    return answer(CMPI_RC_OK);
}

CMPIStatus itemNames(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result, const CMPIObjectPath*) {
    const std::lock_guard lock(mutex);
    for (const auto& [id, count] : items) {
        CMReturnObjectPath(result, itemPath(id));
    }
    CMReturnDone(result);
    return answer(CMPI_RC_OK);
}

CMPIStatus enumerateItems(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result,
                          const CMPIObjectPath*, const char**) {
    const std::lock_guard lock(mutex);
    for (const auto& [id, count] : items) {
        CMReturnInstance(result, makeItem(context, id, count));
    }
    CMReturnDone(result);
    return answer(CMPI_RC_OK);
}

CMPIStatus getItem(CMPIInstanceMI*, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path,
                   const char**) {
    const std::lock_guard lock(mutex);
    const auto found = items.find(idOf(path));
    if (found == items.end()) {
        return answer(CMPI_RC_ERR_NOT_FOUND);
    }
    CMReturnInstance(result, makeItem(context, found->first, found->second));
    CMReturnDone(result);
    return answer(CMPI_RC_OK);
}

CMPIStatus createItem(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result, const CMPIObjectPath*,
                      const CMPIInstance* instance) {
    std::string id = textOf(CMGetProperty(instance, "Id", nullptr));
    if (id == "throws") {
        throw std::runtime_error("the text of the exception");
    }
    id = id.empty() ? "given" : id;
    const std::lock_guard lock(mutex);
    if (!items.emplace(id, CMGetProperty(instance, "Count", nullptr).value.uint16).second) {
        return answer(CMPI_RC_ERR_ALREADY_EXISTS, "there is one already");
    }
    if (id != "silent") {
        CMPIObjectPath* path = itemPath(id);
        CMSetHostname(path, "store.example");
        CMReturnObjectPath(result, path);
    }
    return answer(CMPI_RC_OK);
}

CMPIStatus modifyItem(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result, const CMPIObjectPath* path,
                      const CMPIInstance* instance, const char**) {
    const std::lock_guard lock(mutex);
    const auto found = items.find(idOf(path));
    if (found == items.end()) {
        return answer(CMPI_RC_ERR_NOT_FOUND);
    }
    found->second = CMGetProperty(instance, "Count", nullptr).value.uint16;
    CMReturnDone(result);
    return answer(CMPI_RC_OK);
}

CMPIStatus deleteItem(CMPIInstanceMI*, const CMPIContext*, const CMPIResult*, const CMPIObjectPath* path) {
    const std::string id = idOf(path);
    if (id == "throws") {
        throw std::runtime_error("the text of the exception");
    }
    const std::lock_guard lock(mutex);
    return items.erase(id) == 1 ? answer(CMPI_RC_OK) : answer(CMPI_RC_ERR_NOT_FOUND, "no such item");
}

const CMPIInstanceMIFT itemTable = {
    CMPI_VERSION, CMPI_VERSION, "instanceStore", endInstances, itemNames, enumerateItems,
    getItem,      createItem,   modifyItem,      deleteItem,   nullptr,
};

/** One pair: the items "a" and "b". */
CMPIStatus enumeratePairs(CMPIInstanceMI*, const CMPIContext*, const CMPIResult* result, const CMPIObjectPath* path,
                          const char**) {
    CMPIInstance* pair = CMNewInstance(broker, path, nullptr);
    CMPIObjectPath* left = itemPath("a");
    CMPIObjectPath* right = itemPath("b");
    CMSetProperty(pair, "Left", &left, CMPI_ref);
    CMSetProperty(pair, "Right", &right, CMPI_ref);
    CMReturnInstance(result, pair);
    CMReturnDone(result);
    return answer(CMPI_RC_OK);
}

const CMPIInstanceMIFT pairTable = {
    CMPI_VERSION, CMPI_VERSION, "instancePairs", nullptr, nullptr, enumeratePairs,
    nullptr,      nullptr,      nullptr,         nullptr, nullptr,
};

/** The ids of what an enumeration holds, or the failure. */
std::string listOf(const CMPIEnumeration* enumeration, const CMPIStatus& status) {
    if (enumeration == nullptr) {
        return "status " + std::to_string(status.rc) + " " + textOf(status.msg);
    }
    std::string list;
    while (CMHasNext(enumeration, nullptr) != 0) {
        const CMPIData data = CMGetNext(enumeration, nullptr);
        const CMPIObjectPath* path =
            data.type == CMPI_ref ? data.value.ref : CMGetObjectPath(data.value.inst, nullptr);
        list += (list.empty() ? "" : "|") + textOf(CMObjectPathToString(path, nullptr));
    }
    return list;
}

std::string outcome(const CMPIStatus& status) {
    return "status " + std::to_string(status.rc) + " " + textOf(status.msg);
}

std::string askForAssociations(const CMPIContext* context, const std::string& what) {
    const CMPIBrokerFT& ft = *broker->bft;
    const CMPIObjectPath* a = itemPath("a");
    CMPIStatus status{};
    const CMPIEnumeration* found =
        what == "associators"
            ? ft.associators(broker, context, a, "Test_Pair", nullptr, "Left", "Right", nullptr, &status)
        : what == "associatorNames" ? ft.associatorNames(broker, context, a, nullptr, "Test_Item", "", "", &status)
        : what == "references"      ? ft.references(broker, context, a, "Test_Pair", "Left", nullptr, &status)
                                    : ft.referenceNames(broker, context, a, nullptr, "Right", &status);
    return listOf(found, status);
}

std::string askForChanges(const CMPIContext* context, const std::string& what) {
    const CMPIBrokerFT& ft = *broker->bft;
    const CMPIObjectPath* a = itemPath("a");
    const CMPIUint16 count = 8;
    CMPIStatus status{};
    CMPIInstance* changed = CMNewInstance(broker, a, nullptr);
    CMSetProperty(changed, "Count", &count, CMPI_uint16);
    if (what == "create") {
        const CMPIObjectPath* made = ft.createInstance(broker, context, itemPath("made"), changed, &status);
        return made == nullptr ? outcome(status) : textOf(CMObjectPathToString(made, nullptr));
    }
    if (what == "modify") {
        std::array<const char*, 2> names = {"Count", nullptr};
        return outcome(ft.modifyInstance(broker, context, a, changed, names.data()));
    }
    if (what == "set") {
        return outcome(
            ft.setProperty(broker, context, a, "Count", reinterpret_cast<const CMPIValue*>(&count), CMPI_uint16));
    }
    return outcome(ft.deleteInstance(broker, context, a));
}

std::string ask(const CMPIContext* context, const CMPIObjectPath* self, const std::string& what) {
    const CMPIBrokerFT& ft = *broker->bft;
    CMPIStatus status{};
    if (what == "create" || what == "modify" || what == "delete" || what == "set") {
        return askForChanges(context, what);
    }
    if (what == "query") {
        return listOf(
            ft.execQuery(broker, context, itemPath("a"), "SELECT * FROM Test_Item WHERE Count > 3", "WQL", &status),
            status);
    }
    if (what == "get") {
        const CMPIData data = ft.getProperty(broker, context, itemPath("a"), "count", &status);
        return status.rc == CMPI_RC_OK ? std::to_string(data.value.uint16) : outcome(status);
    }
    if (what == "invoke") {
        CMPIArgs* in = CMNewArgs(broker, nullptr);
        CMPIArgs* out = CMNewArgs(broker, nullptr);
        CMAddArg(in, "What", "nothing", CMPI_chars);
        const CMPIData data = ft.invokeMethod(broker, context, self, "Call", in, out, &status);
        return status.rc == CMPI_RC_OK
                   ? std::to_string(data.value.uint32) + " " + textOf(CMGetArg(out, "Answer", nullptr))
                   : outcome(status);
    }
    return what == "nothing" ? "asked for nothing" : askForAssociations(context, what);
}

CMPIStatus call(CMPIMethodMI*, const CMPIContext* context, const CMPIResult* result, const CMPIObjectPath* path,
                const char*, const CMPIArgs* in, CMPIArgs* out) {
    const std::string text = ask(context, path, textOf(CMGetArg(in, "What", nullptr)));
    const CMPIUint32 zero = 0;
    CMAddArg(out, "Answer", text.c_str(), CMPI_chars);
    CMReturnData(result, &zero, CMPI_uint32);
    CMReturnDone(result);
    return answer(CMPI_RC_OK);
}

const CMPIMethodMIFT callTable = {CMPI_VERSION, CMPI_VERSION, "methodCaller", nullptr, call};

const CMPIInstanceMIFT bareInstances = {CMPI_VERSION, CMPI_VERSION, "instanceBare", nullptr, nullptr, nullptr,
                                        nullptr,      nullptr,      nullptr,        nullptr, nullptr};
const CMPIMethodMIFT bareMethods = {CMPI_VERSION, CMPI_VERSION, "methodBare", nullptr, nullptr};
const CMPIIndicationMIFT bareIndications = {CMPI_VERSION, CMPI_VERSION, "indicationBare", nullptr, nullptr,
                                            nullptr,      nullptr,      nullptr,          nullptr, nullptr,
                                            nullptr,      nullptr,      nullptr};

/** A later version may have more slots at its end. */
CMPIInstanceMIFT withVersion(CMPIVersion version) {
    CMPIInstanceMIFT table = itemTable;
    table.ftVersion = version;
    return table;
}

const CMPIInstanceMIFT laterTable = withVersion(CMPI_VERSION + 10);
const CMPIInstanceMIFT firstTable = withVersion(100);
const CMPIInstanceMIFT olderTable = withVersion(90);

} // namespace

#define FACTORY(name, kind, table)                                                                                   \
    CMPI_EXTERN_C CMPI##kind##MI* name##_Create_##kind##MI(const CMPIBroker* mb, const CMPIContext*, CMPIStatus*) {  \
        static CMPI##kind##MI interface = {nullptr, table};                                                          \
        broker = mb;                                                                                                 \
        return &interface;                                                                                           \
    }

FACTORY(Store, Instance, &itemTable)
FACTORY(Pairs, Instance, &pairTable)
FACTORY(Caller, Method, &callTable)
FACTORY(Bare, Instance, &bareInstances)
FACTORY(Bare, Method, &bareMethods)
FACTORY(Bare, Indication, &bareIndications)
FACTORY(Later, Instance, &laterTable)
FACTORY(First, Instance, &firstTable)
FACTORY(Older, Instance, &olderTable)
FACTORY(Tableless, Instance, nullptr)
