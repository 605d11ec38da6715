// One place in the data store's tree: a value, its flags, its events, and what lies below.
#pragma once

#include "StageCoreDataStore/DataNode.h"
#include "StageCoreDataStoreTypes/DataPath.h"
#include "StageCoreRuntime/Variant.h"

#include <array>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <string_view>

namespace StageHost
{

// In the order in which a node offers them.
enum class EDataEvent
{
  Proposed,
  Changed,
  Added,
  Removed,
  Flags,
  Branch
};

constexpr size_t DataEventCount = 6;

// Once made, a node lives as long as the store, so that its events and bindings to it stay good. A wildcard place is a node like any other
// whose segment is "*". Everything but the events themselves is guarded by the store's lock.
class VDataStoreNode final : public IDataNode
{
public:
  using VChildren = std::map<std::string, std::unique_ptr<VDataStoreNode>, std::less<>>;

  VDataStoreNode( VDataStoreNode* i_pParent, std::string_view i_Segment );

  VEvent& OnProposedValue() override { return Event( EDataEvent::Proposed ); }
  VEvent& OnValueChanged() override { return Event( EDataEvent::Changed ); }
  VEvent& OnValueAdded() override { return Event( EDataEvent::Added ); }
  VEvent& OnValueRemoved() override { return Event( EDataEvent::Removed ); }
  VEvent& OnFlagsChanged() override { return Event( EDataEvent::Flags ); }
  VEvent& OnBranchChanged() override { return Event( EDataEvent::Branch ); }

  const std::string& Segment() const { return m_Segment; }
  bool IsWildcard() const { return m_bWildcard; }
  VDataStoreNode* Parent() const { return m_pParent; }
  const VChildren& Children() const { return m_Children; }
  VDataStoreNode* Child( std::string_view i_Segment ) const;
  VDataStoreNode& MakeChild( std::string_view i_Segment );
  VDataPath Path() const;

  // The events can be subscribed to from now on. Before, nobody can have.
  void OfferEvents();
  bool HasEvents() const { return m_pEvents != nullptr; }
  // Whether anybody would hear it.
  bool IsHeard( EDataEvent i_Event ) const;
  void Fire( EDataEvent i_Event );

  bool HasValue() const { return !m_Proposed.IsEmpty() || !m_Verified.IsEmpty(); }
  // The form that counts.
  const KVZ::Variant& Current() const { return m_Verified.IsEmpty() ? m_Proposed : m_Verified; }

  KVZ::Variant m_Proposed;
  KVZ::Variant m_Verified;
  bool m_bWaiting = false;   // a proposal waits for the owner's answer
  uint32_t m_Flags = 0;
  uint64_t m_Stamp = 0;               // of the last change here or below
  unsigned int m_PendingEvents = 0;   // bit by EDataEvent: noted under the write lock in force

private:
  using VEventImpl = NotificationSystem::VMultiCallbackPostal<void()>;

  VEventImpl& Event( EDataEvent i_Event ) const { return ( *m_pEvents )[static_cast<size_t>( i_Event )]; }

  VDataStoreNode* const m_pParent;   // null for the root
  const std::string m_Segment;
  const bool m_bWildcard;
  VChildren m_Children;
  std::unique_ptr<std::array<VEventImpl, DataEventCount>> m_pEvents;
};

}
