#pragma once

#include "BSet.h"
#include "CComponent_Thread_NoRef.h"

#include <functional>
#include <memory>

class IComponentManager;

// The data manager component ("tessel:DM?DataManager"): a thread-safe tree of typed values
// addressed by "data:/" identifiers. Each path segment is a nested set, so reading an inner
// node gives the whole set below it.
class TESSEL_EXPORT CDataManager : public CComponent_Thread_NoRef
{
public:
    enum Result
    {
        eOK = 0,
        eNOT_A_DATA_URI = 1,
        eNO_SUCH_DATA = 2,
        eWRONG_TYPE = 3
    };
    using Listener = std::function<void(const ID& uri)>;
    using ValueVisitor = std::function<void(const ACE_WString& key, const BData& value)>;
    using NestedValueVisitor =
        std::function<void(const ACE_WString& setKey, const ACE_WString& key, const BData& value)>;

    static const wchar_t* const componentID;

    CDataManager();
    ~CDataManager() override;

    // Registers a new data manager with `manager`; returns it (owned by the manager) or null.
    static CDataManager* registerWith(IComponentManager& manager);

    int createData(const ID& uri, const BData& value);
    // The same, taking the set's values over instead of copying them; `value` is left empty.
    int createData(const ID& uri, BSet&& value);
    int setData(const ID& uri, const BData& value);
    int getData(const ID& uri, BData& value) const;
    // Calls `visit` for each value (not nested set) directly in the set at `uri`, in order,
    // without copying them. Runs under the data manager's lock: `visit` must not call it.
    int visitValues(const ID& uri, const ValueVisitor& visit) const;
    // The same one level down: calls `visit` for each value directly in each set directly in the
    // set at `uri`, with that set's key, in order. `entries` is the number of entries (values and
    // sets) directly in the set at `uri`.
    int visitNestedValues(const ID& uri, int& entries, const NestedValueVisitor& visit) const;
    int setBool(const ID& uri, bool value);
    int getBool(const ID& uri, bool& value) const;
    int setString(const ID& uri, const ACE_WString& value);
    int getString(const ID& uri, ACE_WString& value) const;
    int removeData(const ID& uri);

    // Merges the set in the XML file at `path` into the tree under `rootUri`
    // (for example "data:/Configuration"). False when the file cannot be read.
    bool preload(const ACE_WString& path, const ID& rootUri);

    // Called after every change, with the URI written, on the writer's thread.
    int addListener(Listener listener);
    void removeListener(int handle);

private:
    struct Impl;
    std::unique_ptr<Impl> m_impl;
};
