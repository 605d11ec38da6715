// The events of one place in the data store's tree.
#pragma once

#include "NotificationSystem/MultiCallback.h"

// A place in the tree, wildcard places included: there an event fires when it fires at any place that the wildcards stand for.
//
// Events tell that something happened and carry no value. They go out when the writing thread gives its write lock back, each once
// however often it happened under that lock. A subscriber with a postal service hears it there; one without is called on the writing
// thread, which holds no lock any more, so that it may read and write. A subscriber hears of what is written after it has subscribed.
//
// Valid while the store lives. Any thread may subscribe.
class IDataNode
{
public:
  using VEvent = KVZ::IMultiCallbackPostal<void()>;

  IDataNode() = default;
  IDataNode( const IDataNode& ) = delete;
  IDataNode& operator=( const IDataNode& ) = delete;

  // Someone has proposed a value, the same one as before included.
  virtual VEvent& OnProposedValue() = 0;
  // The value that counts has become another one, or none, or has been settled by its owner. See IDataStore.
  virtual VEvent& OnValueChanged() = 0;
  // There is a value where none was.
  virtual VEvent& OnValueAdded() = 0;
  virtual VEvent& OnValueRemoved() = 0;
  virtual VEvent& OnFlagsChanged() = 0;
  // Any of the other five here or anywhere below.
  virtual VEvent& OnBranchChanged() = 0;
  virtual ~IDataNode() = default;
};
