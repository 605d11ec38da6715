// What one frame becomes at the vendor's interface: a video frame and an audio packet around the captured frame, used again and again.
#pragma once

#include "VendorInterfaces/DeckLinkAPI.h"
#include "cards/common/CapturedFrame.h"
#include "cards/common/Recycler.h"
#include "cards/decklink/References.h"

#include <atomic>
#include <memory>

namespace VirtualCards
{

class VInputSlot;
using VInputSlots = VRecycler<VInputSlot>;

struct VFrameTimes
{
  int64_t m_Hardware = 0;   // ticks of 1/135000000 s
  int64_t m_Stream = 0;
  int64_t m_Duration = 0;
};

// Ticks of 1/135000000 s in units of another scale, rounded down.
int64_t ToScale( int64_t i_Ticks, int64_t i_Scale );

class VInputFrame final : public DeckLinkAPI::IDeckLinkVideoInputFrame
{
public:
  explicit VInputFrame( VInputSlot& i_rSlot ) : m_rSlot( i_rSlot ) {}
  virtual ~VInputFrame() = default;

  DeckLinkAPI::HRESULT QueryInterface( DeckLinkAPI::REFIID i_Id, void** o_ppObject ) override;
  DeckLinkAPI::ULONG AddRef() override { return m_References.AddRef(); }
  DeckLinkAPI::ULONG Release() override;

  long GetWidth() override;
  long GetHeight() override;
  long GetRowBytes() override;
  uint32_t GetPixelFormat() override;
  uint32_t GetFlags() override;
  DeckLinkAPI::HRESULT GetBytes( void** o_ppBuffer ) override;
  DeckLinkAPI::HRESULT GetTimecode( uint32_t i_Format, DeckLinkAPI::IDeckLinkTimecode** o_ppTimecode ) override;
  DeckLinkAPI::HRESULT GetAncillaryData( DeckLinkAPI::IDeckLinkVideoFrameAncillary** o_ppAncillary ) override;
  DeckLinkAPI::HRESULT GetStreamTime( int64_t* o_pFrameTime, int64_t* o_pFrameDuration, int64_t i_TimeScale ) override;
  DeckLinkAPI::HRESULT GetHardwareReferenceTimestamp( int64_t i_TimeScale, int64_t* o_pFrameTime, int64_t* o_pFrameDuration ) override;

private:
  friend class VInputSlot;
  VInputSlot& m_rSlot;
  VReferences m_References{ VReferences::EFirst::Own };
};

class VInputPacket final : public DeckLinkAPI::IDeckLinkAudioInputPacket
{
public:
  explicit VInputPacket( VInputSlot& i_rSlot ) : m_rSlot( i_rSlot ) {}
  virtual ~VInputPacket() = default;

  DeckLinkAPI::HRESULT QueryInterface( DeckLinkAPI::REFIID i_Id, void** o_ppObject ) override;
  DeckLinkAPI::ULONG AddRef() override { return m_References.AddRef(); }
  DeckLinkAPI::ULONG Release() override;

  long GetSampleFrameCount() override;
  DeckLinkAPI::HRESULT GetBytes( void** o_ppBuffer ) override;
  DeckLinkAPI::HRESULT GetPacketTime( int64_t* o_pPacketTime, int64_t i_TimeScale ) override;

private:
  friend class VInputSlot;
  VInputSlot& m_rSlot;
  VReferences m_References{ VReferences::EFirst::Own };
};

// Filled by the card's thread, then read by any thread until the last reference on either object has gone.
class VInputSlot
{
public:
  VInputSlot() : m_Video( *this ), m_Audio( *this ) {}

  // The objects hold the slot, and the slot its pool, until they are given up.
  void HandOut( std::shared_ptr<VInputSlots> i_pPool );
  // The library's own references end.
  void GiveUp();

  VInputFrame& Video() { return m_Video; }
  VInputPacket& Audio() { return m_Audio; }

  VCapturedFrame m_Frame;
  VSoundLayout m_SoundLayout;
  VFrameTimes m_Times;
  uint32_t m_PixelFormat = 0;   // the vendor's
  bool m_bSignal = false;

private:
  friend class VInputFrame;
  friend class VInputPacket;
  void ObjectEnded();

  VInputFrame m_Video;
  VInputPacket m_Audio;
  std::atomic<int> m_Objects{ 0 };   // with references
  std::shared_ptr<VInputSlots> m_pPool;
};

}
