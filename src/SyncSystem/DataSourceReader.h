// The place of a data source's live reader: it hands out each frame of the newest started session once, and keeps up by dropping evenly.
#pragma once

#include "StageCoreRuntime/GlobalLog.h"
#include "StageCoreRuntime/ThreadAnnotations.h"
#include "SyncSystem/DataSourceFrames.h"

#include <boost/thread/mutex.hpp>

#include <cstdint>
#include <memory>

namespace SyncSystem
{

// Any thread; frames go to whoever reads first.
class VDataSourceReader
{
public:
  VDataSourceReader( std::shared_ptr<VTimeBasedCaptureBuffer> i_pBuffer, const KVZ::VLogCategory& i_rLog );

  // The frames since the last call, of which all but i_MaxFrames (at least 1) are marked as dropped. The session may be empty or not started
  // yet: then there is none. Frames of a session begin at its live start.
  EReadResult::Enum Read( const std::shared_ptr<const VGlobalSyncSessionInfo>& i_pNewest, uint64_t i_MaxFrames, VReadFrames& o_rRead );

private:
  void BeginSession( const VGlobalSyncSessionInfo& i_rInfo ) REQUIRES( m_Mutex );
  // Frames from the present place to the session's newest; below 1 for none.
  int64_t CountFrames( const VGlobalSyncSessionInfo& i_rInfo ) const REQUIRES( m_Mutex );
  void ReadUpTo( int64_t i_Frames, const VGlobalSyncSessionInfo& i_rInfo, VReadFrames& o_rRead ) REQUIRES( m_Mutex );
  int64_t SkipEvicted( int64_t i_Frames, KVZ::VTick i_Period ) REQUIRES( m_Mutex );
  void Advance( int64_t i_Frames, KVZ::VTick i_Period ) REQUIRES( m_Mutex );

  // Fixed after construction
  const std::shared_ptr<VTimeBasedCaptureBuffer> m_pBuffer;
  const KVZ::VLogCategory& m_rLog;

  boost::mutex m_Mutex;
  KVZ::VGlobalSyncSessionId m_ReadGlobal GUARDED_BY( m_Mutex );
  KVZ::VTick m_ReadTick GUARDED_BY( m_Mutex );   // global tick of m_ReadPosition
  VToken m_ReadPosition GUARDED_BY( m_Mutex );   // of the next frame to hand out
};

}
