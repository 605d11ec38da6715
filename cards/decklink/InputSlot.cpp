#include "cards/decklink/InputSlot.h"

#include "cards/decklink/FrameTimecode.h"

namespace VirtualCards
{

using namespace DeckLinkAPI;

namespace
{

constexpr int64_t TicksPerSecond = 135000000;

// Answers QueryInterface for an object with one interface.
template<class TInterface>
HRESULT GiveInterface( TInterface* i_pObject, bool i_bKnown, void** o_ppObject )
{
  if( !o_ppObject )
  {
    return E_POINTER;
  }
  *o_ppObject = i_bKnown ? i_pObject : nullptr;
  if( i_bKnown )
  {
    i_pObject->AddRef();
  }
  return i_bKnown ? S_OK : E_NOINTERFACE;
}

HRESULT GiveTimes( int64_t i_Time, int64_t i_Duration, int64_t i_TimeScale, int64_t* o_pTime, int64_t* o_pDuration )
{
  if( !o_pTime || !o_pDuration || i_TimeScale <= 0 )
  {
    return i_TimeScale <= 0 ? E_INVALIDARG : E_POINTER;
  }
  *o_pTime = ToScale( i_Time, i_TimeScale );
  *o_pDuration = ToScale( i_Duration, i_TimeScale );
  return S_OK;
}

}

int64_t ToScale( int64_t i_Ticks, int64_t i_Scale )
{
  return i_Ticks / TicksPerSecond * i_Scale + i_Ticks % TicksPerSecond * i_Scale / TicksPerSecond;
}

HRESULT VInputFrame::QueryInterface( REFIID i_Id, void** o_ppObject )
{
  const bool bKnown = i_Id == IID_IDeckLinkVideoInputFrame || i_Id == IID_IDeckLinkVideoFrame || i_Id == IID_IUnknown;
  return GiveInterface<IDeckLinkVideoInputFrame>( this, bKnown, o_ppObject );
}

ULONG VInputFrame::Release()
{
  const ULONG Left = m_References.Release();
  if( Left == 0 )
  {
    m_rSlot.ObjectEnded();
  }
  return Left;
}

long VInputFrame::GetWidth() { return m_rSlot.m_Frame.Format().Width(); }

long VInputFrame::GetHeight() { return m_rSlot.m_Frame.Format().Height(); }

long VInputFrame::GetRowBytes() { return m_rSlot.m_Frame.Format().RowBytes(); }

uint32_t VInputFrame::GetPixelFormat() { return m_rSlot.m_PixelFormat; }

uint32_t VInputFrame::GetFlags() { return m_rSlot.m_bSignal ? 0 : FrameFlag::NoInputSource; }

HRESULT VInputFrame::GetBytes( void** o_ppBuffer )
{
  if( !o_ppBuffer )
  {
    return E_POINTER;
  }
  *o_ppBuffer = m_rSlot.m_Frame.PictureBytes();
  return S_OK;
}

HRESULT VInputFrame::GetTimecode( uint32_t i_Format, IDeckLinkTimecode** o_ppTimecode )
{
  return GetFrameTimecode( m_rSlot.m_Frame.Signal(), i_Format, o_ppTimecode );
}

HRESULT VInputFrame::GetAncillaryData( IDeckLinkVideoFrameAncillary** o_ppAncillary )
{
  if( !o_ppAncillary )
  {
    return E_POINTER;
  }
  *o_ppAncillary = nullptr;   // the signal's ancillary lines are empty but for timecode, which has its own way out
  return S_FALSE;
}

HRESULT VInputFrame::GetStreamTime( int64_t* o_pFrameTime, int64_t* o_pFrameDuration, int64_t i_TimeScale )
{
  return GiveTimes( m_rSlot.m_Times.m_Stream, m_rSlot.m_Times.m_Duration, i_TimeScale, o_pFrameTime, o_pFrameDuration );
}

HRESULT VInputFrame::GetHardwareReferenceTimestamp( int64_t i_TimeScale, int64_t* o_pFrameTime, int64_t* o_pFrameDuration )
{
  return GiveTimes( m_rSlot.m_Times.m_Hardware, m_rSlot.m_Times.m_Duration, i_TimeScale, o_pFrameTime, o_pFrameDuration );
}

HRESULT VInputPacket::QueryInterface( REFIID i_Id, void** o_ppObject )
{
  const bool bKnown = i_Id == IID_IDeckLinkAudioInputPacket || i_Id == IID_IUnknown;
  return GiveInterface<IDeckLinkAudioInputPacket>( this, bKnown, o_ppObject );
}

ULONG VInputPacket::Release()
{
  const ULONG Left = m_References.Release();
  if( Left == 0 )
  {
    m_rSlot.ObjectEnded();
  }
  return Left;
}

long VInputPacket::GetSampleFrameCount() { return m_rSlot.m_Frame.Sound().m_Samples; }

HRESULT VInputPacket::GetBytes( void** o_ppBuffer )
{
  if( !o_ppBuffer )
  {
    return E_POINTER;
  }
  *o_ppBuffer = m_rSlot.m_Frame.SoundBytes( m_rSlot.m_SoundLayout );
  return S_OK;
}

HRESULT VInputPacket::GetPacketTime( int64_t* o_pPacketTime, int64_t i_TimeScale )
{
  if( !o_pPacketTime || i_TimeScale <= 0 )
  {
    return i_TimeScale <= 0 ? E_INVALIDARG : E_POINTER;
  }
  *o_pPacketTime = ToScale( m_rSlot.m_Times.m_Stream, i_TimeScale );
  return S_OK;
}

void VInputSlot::HandOut( std::shared_ptr<VInputSlots> i_pPool )
{
  m_pPool = std::move( i_pPool );
  m_Objects = 2;
  m_Video.m_References.TakeOwn();
  m_Audio.m_References.TakeOwn();
}

void VInputSlot::GiveUp()
{
  // Whichever object ends last gives the slot back, after which it may be in use again
  VInputPacket& rAudio = m_Audio;
  if( m_Video.m_References.ReleaseOwn() )
  {
    ObjectEnded();
  }
  if( rAudio.m_References.ReleaseOwn() )
  {
    ObjectEnded();
  }
}

void VInputSlot::ObjectEnded()
{
  if( --m_Objects == 0 )
  {
    // The pool may end with this, and the slot with it
    const std::shared_ptr<VInputSlots> pPool = std::move( m_pPool );
    pPool->Give( this );
  }
}

}
