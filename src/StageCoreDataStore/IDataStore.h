// The host's one tree of settings. It is reached through the guards (VDataReader, VDataWriter, VDataVerifyReader, VDataVerifyWriter),
// never directly: they hold its lock.
#pragma once

#include "StageCoreDataStore/DataNode.h"
#include "StageCoreDataStoreTypes/DataPath.h"
#include "StageCoreRuntime/Variant.h"

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

// Which of a value's two stored forms an access means.
enum class EDataForm : uint32_t
{
  Proposed = 1,   // what someone asked for
  Verified = 2,   // what the owner of the value accepted
  Both = 3        // a write sets both; a read gets the one that counts: the verified form, or the proposed one where no other is
};

// Bits of a value's flags word.
namespace DataFlags
{
constexpr uint32_t ReadOnly = 1;         // users may not write; the owner may
constexpr uint32_t VerifyRequired = 2;   // a proposed value waits for the owner's verified value
constexpr uint32_t NotSerialized = 4;    // left out of what is saved
}

// Values and proposals. A value without VerifyRequired settles as it is written: whatever form is proposed becomes the verified one too,
// and OnValueChanged fires if the value that counts is another one now.
//
// With VerifyRequired a write of the proposed form, or of both, is a proposal: OnProposedValue fires, always, and the proposal waits until
// the verified form is written, which settles it; then OnValueChanged fires, whether or not the answer differs from the value before. Where
// nobody listens to proposals, nobody would answer, and a write of both forms settles at once.
//
// Locks. Readers share the lock, a writer has it alone. One thread may nest readers, and writers and readers inside its writer; a writer
// inside a reader is refused. A lock belongs to its thread: guards move between functions, never between threads.
//
// Values live at concrete paths: a write to a wildcard path or to the empty path is refused, and a read finds nothing there.
// The order of the operations is binding.
class IDataStore
{
public:
  IDataStore() = default;
  IDataStore( const IDataStore& ) = delete;
  IDataStore& operator=( const IDataStore& ) = delete;

  virtual ~IDataStore() = default;   // 1

  // Waits. The word is 1 for a shared lock and 2 inside a writer of the same thread, whose lock serves the reader too.
  virtual void AcquireReadLock( uint32_t& o_rState ) = 0;   // 2
  virtual void ReleaseReadLock() = 0;                       // 3
  // Waits; false at once if this thread holds a read lock.
  virtual bool AcquireWriteLock() = 0;   // 4
  virtual void ReleaseWriteLock() = 0;   // 5

  // The place of a path, which may hold wildcards; made if it is missing. Write lock.
  virtual IDataNode* GetNode( const VDataAddress& i_rAddress ) = 0;   // 6

  virtual void Reserved7() {}

  // Reads of the tree; outputs are cleared first.

  // The segments right below that lead to a value or to flags, in alphabetical order. False if there are none.
  virtual bool GetChildNames( const VDataAddress& i_rAddress, std::vector<std::string>& o_rNames ) = 0;   // 8
  // The paths of all values here and below. False if there are none.
  virtual bool GetValuePaths( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) = 0;   // 9
  // The paths of the values that a path with wildcards stands for. False if there are none.
  virtual bool GetMatches( const VDataAddress& i_rAddress, std::vector<VDataPath>& o_rPaths ) = 0;   // 10
  // Counts the changes here and below since the store was made: two equal stamps mean that nothing has changed between them.
  virtual uint64_t GetChangeStamp( const VDataAddress& i_rAddress ) = 0;   // 11

  virtual bool Exists( const VDataAddress& i_rAddress ) = 0;                                               // 12
  virtual bool GetValue( const VDataAddress& i_rAddress, KVZ::Variant& o_rValue, EDataForm i_Form ) = 0;   // 13
  // False while a proposal waits for its answer, and where there is no value.
  virtual bool IsSettled( const VDataAddress& i_rAddress ) = 0;   // 14
  // False where there is neither a value nor a flag.
  virtual bool GetValueFlags( const VDataAddress& i_rAddress, uint32_t& o_rFlags ) = 0;   // 15
  // The type of the value that counts; null where there is none.
  virtual void GetSchema( const VDataAddress& i_rAddress, const KVZ::ISchema*& o_rpSchema ) = 0;   // 16
  // The place of a path if GetNode has been asked for it before; otherwise null.
  virtual void FindNode( const VDataAddress& i_rAddress, IDataNode*& o_rpNode ) = 0;   // 17
  // How many values there are here and below.
  virtual size_t CountValues( const VDataAddress& i_rAddress ) = 0;   // 18

  // Writes. True if something was stored or taken away; an empty Variant is refused. Write lock.

  virtual bool SetValue( const VDataAddress& i_rAddress, const KVZ::Variant& i_rValue, EDataForm i_Form ) = 0;   // 19

  virtual void Reserved20() {}

  // Removes both forms. The flags stay with the place, unless the second argument has bit 0.
  virtual bool RemoveValue( const VDataAddress& i_rAddress, uint32_t i_Options ) = 0;   // 21
  // Removes all values here and below with their flags.
  virtual bool RemoveBranch( const VDataAddress& i_rAddress ) = 0;   // 22
  // Gives up the waiting proposal: the verified form settles it, and OnValueChanged fires. False if none waits or there is no verified form.
  virtual bool DiscardProposal( const VDataAddress& i_rAddress ) = 0;                   // 23
  virtual bool SetValueFlags( const VDataAddress& i_rAddress, uint32_t i_Flags ) = 0;   // 24
};
