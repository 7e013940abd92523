#include "CDataManager.h"

#include "BBool.h"
#include "BString.h"
#include "IComponentManager.h"
#include "PDataManager.h"
#include "TesselLog_Static.h"
#include "WideString.h"

#include <algorithm>
#include <map>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

namespace
{
const char* const kComponent = "tesselComponents";
const char* const kFile = "tesselComponents.dll";
const char* const kClass = "CDataManager";

// One value of the tree: a leaf holds a typed value, a set node (no value) holds children in
// the order they were first written.
struct Node
{
    std::unique_ptr<BData> value;
    std::vector<std::pair<ACE_WString, std::unique_ptr<Node>>> children;

    bool isSet() const { return value == nullptr; }

    Node* child(const ACE_WString& key) const
    {
        for (const auto& [name, node] : children)
            if (name == key)
                return node.get();
        return nullptr;
    }

    // The slot for `key`, appended empty when absent.
    std::unique_ptr<Node>& slot(const ACE_WString& key)
    {
        for (auto& [name, node] : children)
            if (name == key)
                return node;
        children.emplace_back(key, nullptr);
        return children.back().second;
    }

    bool removeChild(const ACE_WString& key)
    {
        for (auto it = children.begin(); it != children.end(); ++it)
        {
            if (it->first == key)
            {
                children.erase(it);
                return true;
            }
        }
        return false;
    }
};

std::unique_ptr<Node> nodeFrom(const BData& data)
{
    auto node = std::make_unique<Node>();
    if (data.type() != BData::eSET)
    {
        node->value = data.clone();
        return node;
    }
    const BSet& set = static_cast<const BSet&>(data);
    for (int i = 0; i < set.size(); ++i)
        node->children.emplace_back(set.keyAt(i), nodeFrom(set.valueAt(i)));
    return node;
}

std::unique_ptr<Node> nodeTaking(BSet& set);

// The node of `data`, its values taken over; nested sets are emptied.
std::unique_ptr<Node> nodeTaking(std::unique_ptr<BData> data)
{
    if (data->type() != BData::eSET)
    {
        auto node = std::make_unique<Node>();
        node->value = std::move(data);
        return node;
    }
    return nodeTaking(static_cast<BSet&>(*data));
}

std::unique_ptr<Node> nodeTaking(BSet& set)
{
    auto node = std::make_unique<Node>();
    node->children.reserve(static_cast<size_t>(set.size()));
    set.drain([&node](const ACE_WString& key, std::unique_ptr<BData> value) {
        node->children.emplace_back(key, nodeTaking(std::move(value)));
    });
    return node;
}

void fillSet(const Node& node, BSet& set)
{
    for (const auto& [name, child] : node.children)
    {
        if (child->isSet())
        {
            auto inner = std::make_unique<BSet>();
            fillSet(*child, *inner);
            set.put(name, std::move(inner));
        }
        else
        {
            set.set(name, *child->value);
        }
    }
}

// Writes `source` into the set node `target`: nested sets meet key by key, anything else replaces.
void merge(Node& target, const BSet& source)
{
    for (int i = 0; i < source.size(); ++i)
    {
        const BData& value = source.valueAt(i);
        std::unique_ptr<Node>& slot = target.slot(source.keyAt(i));
        if (value.type() == BData::eSET && slot != nullptr && slot->isSet())
            merge(*slot, static_cast<const BSet&>(value));
        else
            slot = nodeFrom(value);
    }
}

bool isDataUri(const ID& uri)
{
    return uri.getScheme() == ACE_WString(L"data");
}

// The path segments of a "data:" identifier; empty segments are skipped.
std::vector<ACE_WString> segmentsOf(const ID& uri)
{
    std::vector<ACE_WString> segments;
    const ACE_WString path = uri.getPath();
    const wchar_t* const text = path.c_str();
    const size_t length = path.length();
    segments.reserve(static_cast<size_t>(std::count(text, text + length, L'/')) + 1);
    size_t start = 0;
    for (size_t i = 0; i <= length; ++i)
    {
        if (i < length && text[i] != L'/')
            continue;
        if (i > start)
            segments.emplace_back(text + start, i - start);
        start = i + 1;
    }
    return segments;
}

void logNotDataUri(const char* operation, const ID& uri)
{
    TesselLog_Static::logError_static(kComponent, kFile, kClass, CDataManager::eNOT_A_DATA_URI,
                                      "[CDataManager::%s()] '%S' is not a data URI", operation,
                                      uri.getString().c_str());
}
}

struct CDataManager::Impl
{
    // The node at `segments`, or null.
    const Node* find(const std::vector<ACE_WString>& segments) const
    {
        const Node* node = &root;
        for (const ACE_WString& segment : segments)
        {
            if (!node->isSet())
                return nullptr;
            node = node->child(segment);
            if (node == nullptr)
                return nullptr;
        }
        return node;
    }

    // Calls `use` with the set node at `segments`, under the lock.
    template <class Use>
    int withSet(const std::vector<ACE_WString>& segments, Use&& use) const
    {
        std::lock_guard<std::mutex> lock(mutex);
        const Node* node = find(segments);
        if (node == nullptr)
            return eNO_SUCH_DATA;
        if (!node->isSet())
            return eWRONG_TYPE;
        use(*node);
        return eOK;
    }

    // The set node holding the last segment; made on the way (replacing values) when `create`.
    Node* parentOf(const std::vector<ACE_WString>& segments, bool create)
    {
        Node* node = &root;
        for (size_t i = 0; i + 1 < segments.size(); ++i)
        {
            if (!create)
            {
                Node* next = node->child(segments[i]);
                if (next == nullptr || !next->isSet())
                    return nullptr;
                node = next;
                continue;
            }
            std::unique_ptr<Node>& slot = node->slot(segments[i]);
            if (slot == nullptr || !slot->isSet())
                slot = std::make_unique<Node>();
            node = slot.get();
        }
        return node;
    }

    void notify(const ID& uri)
    {
        std::vector<Listener> toCall;
        {
            std::lock_guard<std::mutex> lock(listenerMutex);
            for (const auto& [handle, listener] : listeners)
                toCall.push_back(listener);
        }
        for (const Listener& listener : toCall)
            listener(uri);
    }

    mutable std::mutex mutex;
    Node root;

    std::mutex listenerMutex;
    std::map<int, Listener> listeners;
    int nextListener = 1;
};

const wchar_t* const CDataManager::componentID = L"tessel:DM?DataManager";

CDataManager::CDataManager() : CComponent_Thread_NoRef(ID(componentID)), m_impl(std::make_unique<Impl>())
{
}

CDataManager::~CDataManager() = default;

CDataManager* CDataManager::registerWith(IComponentManager& manager)
{
    auto component = std::make_unique<CDataManager>();
    CDataManager* registered = component.get();
    const int result =
        manager.registerComponent(std::move(component), [](IComponent* served) { return new PDataManager(served); });
    return result == 0 ? registered : nullptr;
}

int CDataManager::createData(const ID& uri, const BData& value)
{
    const std::vector<ACE_WString> segments = segmentsOf(uri);
    if (!isDataUri(uri) || segments.empty())
    {
        logNotDataUri("createData", uri);
        return eNOT_A_DATA_URI;
    }
    {
        std::lock_guard<std::mutex> lock(m_impl->mutex);
        Node* parent = m_impl->parentOf(segments, true);
        parent->slot(segments.back()) = nodeFrom(value);
    }
    m_impl->notify(uri);
    return eOK;
}

int CDataManager::createData(const ID& uri, BSet&& value)
{
    const std::vector<ACE_WString> segments = segmentsOf(uri);
    if (!isDataUri(uri) || segments.empty())
    {
        logNotDataUri("createData", uri);
        return eNOT_A_DATA_URI;
    }
    std::unique_ptr<Node> node = nodeTaking(value);
    {
        std::lock_guard<std::mutex> lock(m_impl->mutex);
        Node* parent = m_impl->parentOf(segments, true);
        parent->slot(segments.back()) = std::move(node);
    }
    m_impl->notify(uri);
    return eOK;
}

int CDataManager::setData(const ID& uri, const BData& value)
{
    const std::vector<ACE_WString> segments = segmentsOf(uri);
    if (!isDataUri(uri) || segments.empty())
    {
        logNotDataUri("setData", uri);
        return eNOT_A_DATA_URI;
    }
    {
        std::lock_guard<std::mutex> lock(m_impl->mutex);
        Node* parent = m_impl->parentOf(segments, false);
        if (parent == nullptr || parent->child(segments.back()) == nullptr)
            return eNO_SUCH_DATA;
        parent->slot(segments.back()) = nodeFrom(value);
    }
    m_impl->notify(uri);
    return eOK;
}

int CDataManager::getData(const ID& uri, BData& value) const
{
    if (!isDataUri(uri))
    {
        logNotDataUri("getData", uri);
        return eNOT_A_DATA_URI;
    }
    const std::vector<ACE_WString> segments = segmentsOf(uri);
    std::lock_guard<std::mutex> lock(m_impl->mutex);
    const Node* node = m_impl->find(segments);
    if (node == nullptr)
        return eNO_SUCH_DATA;
    if (!node->isSet())
        return value.assign(*node->value) ? eOK : eWRONG_TYPE;
    if (value.type() != BData::eSET)
        return eWRONG_TYPE;
    BSet set;
    fillSet(*node, set);
    static_cast<BSet&>(value) = std::move(set);
    return eOK;
}

int CDataManager::visitValues(const ID& uri, const ValueVisitor& visit) const
{
    if (!isDataUri(uri))
    {
        logNotDataUri("visitValues", uri);
        return eNOT_A_DATA_URI;
    }
    return m_impl->withSet(segmentsOf(uri), [&visit](const Node& node) {
        for (const auto& [name, child] : node.children)
            if (!child->isSet())
                visit(name, *child->value);
    });
}

int CDataManager::visitNestedValues(const ID& uri, int& entries, const NestedValueVisitor& visit) const
{
    entries = 0;
    if (!isDataUri(uri))
    {
        logNotDataUri("visitNestedValues", uri);
        return eNOT_A_DATA_URI;
    }
    return m_impl->withSet(segmentsOf(uri), [&entries, &visit](const Node& node) {
        entries = static_cast<int>(node.children.size());
        for (const auto& [setKey, set] : node.children)
            if (set->isSet())
                for (const auto& [name, child] : set->children)
                    if (!child->isSet())
                        visit(setKey, name, *child->value);
    });
}

int CDataManager::setBool(const ID& uri, bool value)
{
    return createData(uri, BBool(value));
}

int CDataManager::getBool(const ID& uri, bool& value) const
{
    BBool read;
    const int result = getData(uri, read);
    if (result == eOK)
        value = read.value();
    return result;
}

int CDataManager::setString(const ID& uri, const ACE_WString& value)
{
    return createData(uri, BString(value));
}

int CDataManager::getString(const ID& uri, ACE_WString& value) const
{
    BString read;
    const int result = getData(uri, read);
    if (result == eOK)
        value = read.value();
    return result;
}

int CDataManager::removeData(const ID& uri)
{
    const std::vector<ACE_WString> segments = segmentsOf(uri);
    if (!isDataUri(uri) || segments.empty())
    {
        logNotDataUri("removeData", uri);
        return eNOT_A_DATA_URI;
    }
    {
        std::lock_guard<std::mutex> lock(m_impl->mutex);
        Node* parent = m_impl->parentOf(segments, false);
        if (parent == nullptr || !parent->removeChild(segments.back()))
            return eNO_SUCH_DATA;
    }
    m_impl->notify(uri);
    return eOK;
}

bool CDataManager::preload(const ACE_WString& path, const ID& rootUri)
{
    if (!isDataUri(rootUri))
    {
        logNotDataUri("preload", rootUri);
        return false;
    }
    BSet loaded;
    if (!loaded.load(path))
    {
        TesselLog_Static::logError_static(kComponent, kFile, kClass, 0, "[CDataManager::preload()] cannot read '%S'",
                                          path.c_str());
        return false;
    }
    const std::vector<ACE_WString> segments = segmentsOf(rootUri);
    {
        std::lock_guard<std::mutex> lock(m_impl->mutex);
        Node* target = &m_impl->root;
        if (!segments.empty())
        {
            std::unique_ptr<Node>& slot = m_impl->parentOf(segments, true)->slot(segments.back());
            if (slot == nullptr || !slot->isSet())
                slot = std::make_unique<Node>();
            target = slot.get();
        }
        merge(*target, loaded);
    }
    m_impl->notify(rootUri);
    return true;
}

int CDataManager::addListener(Listener listener)
{
    if (!listener)
        return 0;
    std::lock_guard<std::mutex> lock(m_impl->listenerMutex);
    const int handle = m_impl->nextListener++;
    m_impl->listeners.emplace(handle, std::move(listener));
    return handle;
}

void CDataManager::removeListener(int handle)
{
    std::lock_guard<std::mutex> lock(m_impl->listenerMutex);
    m_impl->listeners.erase(handle);
}
