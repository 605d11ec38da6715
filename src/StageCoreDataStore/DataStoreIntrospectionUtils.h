// Copies whole items between data stores: branches whose values are the fields of a record.
#pragma once

#include "StageCoreDataStore/DataStorePersistence.h"

namespace DataStoreIntrospectionUtils
{

// The item has a value for each field of the record, at its path and the field's name; a field that is a record itself may be an item there. A
// field of another type counts as missing. An item with a field in the target is there already.
//
// Options are those of DataStorePersistence. An item that they leave out is no failure. Stops at the first value that could not be copied.
bool CopyItem( const DataStorePersistence::VSource& i_rSource, const DataStorePersistence::VTarget& i_rTarget, const KVZ::ISchema& i_rSchema,
  uint32_t i_Options );

}
