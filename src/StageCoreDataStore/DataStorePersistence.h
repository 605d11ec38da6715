// Copies values between data stores, or between branches of one, so that settings can be saved and brought back.
#pragma once

#include "StageCoreDataStore/DataVerifyWriter.h"

#include <cstdint>

// What was left out or has failed is told in the log, category "DataStore". A copy never takes back what it has copied before a failure.
//
// The source may be the writer of the target itself, for a copy within one store. The guards belong to the calling thread.
namespace DataStorePersistence
{

// Bits of a copy's options.
namespace Options
{
constexpr uint32_t SkipReadOnly = 1;
constexpr uint32_t CopyForms = 2;        // flags and both forms as they are; otherwise what was asked for, as a proposal to the target
constexpr uint32_t SkipExisting = 4;     // what the target has already stays
constexpr uint32_t CopyIncomplete = 8;   // items that lack fields too; see DataStoreIntrospectionUtils
constexpr uint32_t SkipNotSerialized = 16;
}

// A value or a branch, to copy from.
struct VSource
{
  const IDataVerifyReader& m_rDataReader;
  const VDataPath& m_rPath;
};

// And where it goes.
struct VTarget
{
  IDataVerifyWriter& m_rDataWriter;
  const VDataPath& m_rPath;
};

// False if something could not be read or written; a value that the options leave out is no failure.
bool CopyValue( const VSource& i_rSource, const VTarget& i_rTarget, uint32_t i_Options );

// All values at the source's path and below it, to the same places at and below the target's. Stops at the first failure.
bool CopyValues( const VSource& i_rSource, const VTarget& i_rTarget, uint32_t i_Options );

// All values at the path and below it, but those that are read-only or not saved. False if one could not be removed; the others are.
bool RemoveParameterValues( IDataWriter& io_rDataWriter, const VDataPath& i_rPath );

}
