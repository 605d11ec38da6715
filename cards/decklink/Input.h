// The capture side of a virtual card: what a client enables, starts, stops and is called back by.
//
// Any thread may call any operation, from inside a callback too, and with locks of its own held, but for one rule that real cards have
// as well: StopStreams from another thread waits for a callback that is running, so it must not be called with a lock held that the
// callback takes. It stops the streams only then, whatever the callback did to them, and after it no callback begins. All other
// operations never wait for a callback.
//
// Format detection. A client that enabled it is told of the signal's format
//   - when the input first sees a signal, because until then nobody can know its colour space;
//   - when mode or colour space that it enabled are not the signal's: once after each EnableVideoInput and StartStreams and after each
//     change of the signal. So a client that answers by enabling the wrong thing again is told again, before the next frame, for as long
//     as it goes on, and one that does not answer at all is told once.
// The signal is always YCbCr. BGRA frames hold a picture all the same.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "VendorInterfaces/DeckLinkAPI.h"
#include "cards/common/Painter.h"
#include "cards/common/SignalTimeline.h"
#include "cards/decklink/DisplayModes.h"
#include "cards/decklink/Held.h"
#include "cards/decklink/InputSlot.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <memory>
#include <optional>

namespace VirtualCards
{

class VVirtualDeckLink;

// Callbacks of all cards that are running now.
int32_t CallbacksInFlight();

class VInput final : public DeckLinkAPI::IDeckLinkInput
{
public:
  // References are counted by the card object that owns this.
  VInput( DeckLinkAPI::IUnknown& i_rOwner, std::weak_ptr<VVirtualDeckLink> i_pCard );
  virtual ~VInput();

  DeckLinkAPI::HRESULT QueryInterface( DeckLinkAPI::REFIID i_Id, void** o_ppObject ) override { return m_rOwner.QueryInterface( i_Id, o_ppObject ); }
  DeckLinkAPI::ULONG AddRef() override { return m_rOwner.AddRef(); }
  DeckLinkAPI::ULONG Release() override { return m_rOwner.Release(); }

  DeckLinkAPI::HRESULT DoesSupportVideoMode( uint32_t i_DisplayMode, uint32_t i_PixelFormat, uint32_t i_InputFlags, uint32_t* o_pSupport,
    DeckLinkAPI::IDeckLinkDisplayMode** o_ppMode ) override;
  DeckLinkAPI::HRESULT GetDisplayModeIterator( DeckLinkAPI::IDeckLinkDisplayModeIterator** o_ppIterator ) override;
  DeckLinkAPI::HRESULT SetScreenPreviewCallback( DeckLinkAPI::IDeckLinkScreenPreviewCallback* i_pCallback ) override;
  // E_INVALIDARG for a mode, format or flag that the card does not have, E_ACCESSDENIED when another program uses the card.
  DeckLinkAPI::HRESULT EnableVideoInput( uint32_t i_DisplayMode, uint32_t i_PixelFormat, uint32_t i_InputFlags ) override;
  // E_ACCESSDENIED while streams run; the same for the sound.
  DeckLinkAPI::HRESULT DisableVideoInput() override;
  DeckLinkAPI::HRESULT GetAvailableVideoFrameCount( uint32_t* o_pCount ) override;
  DeckLinkAPI::HRESULT SetVideoInputFrameMemoryAllocator( DeckLinkAPI::IDeckLinkMemoryAllocator* i_pAllocator ) override;
  DeckLinkAPI::HRESULT EnableAudioInput( uint32_t i_SampleRate, uint32_t i_SampleType, uint32_t i_Channels ) override;
  DeckLinkAPI::HRESULT DisableAudioInput() override;
  DeckLinkAPI::HRESULT GetAvailableAudioSampleFrameCount( uint32_t* o_pCount ) override;
  // E_UNEXPECTED if nothing is enabled, E_ACCESSDENIED if streams run already. Continues paused streams too; the stream's time begins anew.
  // Waits for a clip to show its first picture.
  DeckLinkAPI::HRESULT StartStreams() override;
  // S_FALSE if there was nothing to stop.
  DeckLinkAPI::HRESULT StopStreams() override;
  // A second call lets paused streams go on, with their time as if they had never stood.
  DeckLinkAPI::HRESULT PauseStreams() override;
  DeckLinkAPI::HRESULT FlushStreams() override;
  DeckLinkAPI::HRESULT SetCallback( DeckLinkAPI::IDeckLinkInputCallback* i_pCallback ) override;
  DeckLinkAPI::HRESULT GetHardwareReferenceClock( int64_t i_TimeScale, int64_t* o_pHardwareTime, int64_t* o_pTimeInFrame,
    int64_t* o_pTicksPerFrame ) override;

  // A frame of the signal passes. Card's thread.
  void OnFrame( const VSignalFrame& i_rFrame );
  // The card has gone out of the machine. Never waits.
  void OnRemoved();

private:
  using VCallback = VHeld<DeckLinkAPI::IDeckLinkInputCallback>;
  enum class EStreams
  {
    Stopped,
    Running,
    Paused
  };
  struct VVideo
  {
    const VDisplayModeRow* m_pMode = nullptr;
    uint32_t m_PixelFormat = 0;   // the vendor's
    uint32_t m_Flags = 0;
    VPictureFormat m_Picture;
  };
  struct VDelivery
  {
    std::shared_ptr<VCallback> m_pCallback;
    VVideo m_Video;
    std::optional<VSoundLayout> m_Audio;
    int64_t m_StreamTime = 0;
  };
  class VFlight;

  // Ticks of 1/135000000 s: the card has been running for an hour, as its time has no meaning in itself.
  static constexpr int64_t HardwareTimeOrigin = 3600ll * 135000000;

  bool MayCallLocked() const REQUIRES( m_Mutex ) { return m_Streams == EStreams::Running && m_StopsWaiting == 0 && m_pCallback != nullptr; }
  bool BeginFlight( const VSignalFrame& i_rFrame );
  void EndFlight();
  bool IsInFlightHere() const REQUIRES( m_Mutex );

  uint32_t FormatEventsLocked( const VSignalFrame& i_rFrame ) const REQUIRES( m_Mutex );
  void Announce( const VSignalFrame& i_rFrame );
  bool PlanDelivery( const VSignalFrame& i_rFrame, VDelivery& o_rDelivery );
  void FillSlot( const VSignalFrame& i_rFrame, const VDelivery& i_rDelivery, VInputSlot& o_rSlot );
  void Deliver( const VSignalFrame& i_rFrame );
  bool MayStillCall();
  std::shared_ptr<const IPainter> Black( const VPictureFormat& i_rFormat );

  DeckLinkAPI::IUnknown& m_rOwner;
  const std::weak_ptr<VVirtualDeckLink> m_pCard;
  const std::shared_ptr<VInputSlots> m_pSlots;

  // Card's thread only
  VPictureFormat m_BlackFormat;
  std::shared_ptr<const IPainter> m_pBlack;

  boost::mutex m_Mutex;
  boost::condition_variable m_FlightEnded;
  bool m_bRemoved GUARDED_BY( m_Mutex ) = false;
  EStreams m_Streams GUARDED_BY( m_Mutex ) = EStreams::Stopped;
  std::optional<VVideo> m_Video GUARDED_BY( m_Mutex );
  std::optional<VSoundLayout> m_Audio GUARDED_BY( m_Mutex );
  std::shared_ptr<VCallback> m_pCallback GUARDED_BY( m_Mutex );
  std::optional<int64_t> m_StreamOrigin GUARDED_BY( m_Mutex );   // signal time of the stream's first frame

  bool m_bInFlight GUARDED_BY( m_Mutex ) = false;   // callbacks for one frame are being made, on m_FlightThread
  boost::thread::id m_FlightThread GUARDED_BY( m_Mutex );
  int m_StopsWaiting GUARDED_BY( m_Mutex ) = 0;
  bool m_bFrameStale GUARDED_BY( m_Mutex ) = false;   // the frame in flight was overtaken while a clip began

  bool m_bEverAnnounced GUARDED_BY( m_Mutex ) = false;
  bool m_bAnnounceOnMismatch GUARDED_BY( m_Mutex ) = false;
  const KVZ::VVideoStandardRow* m_pLastStandard GUARDED_BY( m_Mutex ) = nullptr;
  int64_t m_LastFrameTime GUARDED_BY( m_Mutex ) = 0;
};

}
