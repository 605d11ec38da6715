// Memory for a capture buffer under test, in blocks that hold an exact number of frames, and a buffer whose frames can be recognised.
#pragma once

#include "SyncSystem/CaptureBuffer.h"

#include <cstddef>
#include <cstdint>
#include <memory>

namespace TestSupport
{

// A payload that knows its own number and shows when its memory has been given up.
struct VNumberedPayload
{
  explicit VNumberedPayload( int64_t i_Number ) : m_Number( i_Number ), m_Check( ~i_Number ) {}

  bool Holds( int64_t i_Number ) const { return m_Number == i_Number && m_Check == ~i_Number; }
  void Destroy() { m_Number = m_Check = 0x5D5D5D5D5D5D5D5D; }

  int64_t m_Number;
  int64_t m_Check;
};

inline const VNumberedPayload& NumberedPayload( const SyncSystem::VFrameEntry* i_pEntry )
{
  return *static_cast<const VNumberedPayload*>( SyncSystem::Payload( i_pEntry ) );
}

struct VFrameMemory
{
  VFrameMemory( size_t i_Blocks, size_t i_FramesPerBlock, size_t i_PayloadBytes = sizeof( VNumberedPayload ) )
    : m_pPool( std::make_shared<UtilsMemory::VBalancingAllocator>( BlockBytes( i_FramesPerBlock, i_PayloadBytes ) ) ),
      m_pClient( m_pPool->MakeClient() ),
      m_pAllocator( std::make_shared<SyncSystem::VCaptureBufferAllocator>( m_pClient ) )
  {
    m_pPool->Configure( i_Blocks, 0, 0 );
  }

  // Of a block with room for that many entries and not one more.
  static size_t BlockBytes( size_t i_Frames, size_t i_PayloadBytes )
  {
    const size_t Payload = ( i_PayloadBytes + 15 ) / 16 * 16;
    return 64 + i_Frames * ( 16 + sizeof( SyncSystem::VFrameEntry ) + Payload );
  }

  std::shared_ptr<UtilsMemory::VBalancingAllocator> m_pPool;
  std::shared_ptr<UtilsMemory::VBalancedClientAllocator> m_pClient;
  std::shared_ptr<SyncSystem::VCaptureBufferAllocator> m_pAllocator;
};

// The plain capture buffer, which has no public way to add a frame. TBuffer is it or a class derived from it.
class VNumberedCaptureBuffer : public SyncSystem::VCaptureBuffer
{
public:
  using VCaptureBuffer::VCaptureBuffer;

  static VSettings Settings( const VFrameMemory& i_rMemory, std::shared_ptr<KVZ::IPostalService> i_pPostalService = nullptr )
  {
    return { "Test", i_rMemory.m_pAllocator, &DestroyPayload, std::move( i_pPostalService ) };
  }

  static void DestroyPayload( SyncSystem::VFrameEntry* i_pEntry ) { static_cast<VNumberedPayload*>( SyncSystem::Payload( i_pEntry ) )->Destroy(); }

  // Stores a frame whose payload holds its number. An empty token if there is no memory. One thread only.
  SyncSystem::VToken Add()
  {
    SyncSystem::VFrameEntry* pEntry = NewEntry( sizeof( VNumberedPayload ) );
    if( !pEntry ) return {};
    new( SyncSystem::Payload( pEntry ) ) VNumberedPayload( m_Added + 1 );
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    ++m_Added;
    return AddFrameUnlocked( pEntry );
  }

private:
  int64_t m_Added = 0;   // the adding thread's
};

}
