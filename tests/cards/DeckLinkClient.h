// A client of the virtual library as a program with the vendor's kit would be: through the exported names and the interfaces alone.
#pragma once

#include "HardwareSupport/VideoInput/VideoInputDeviceBlackmagic/ComPointer.h"
#include "tests/support/CardFixture.h"
#include "tests/support/CounterReader.h"
#include "tests/support/RampReader.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

#include <algorithm>
#include <atomic>
#include <cstdlib>
#include <functional>
#include <string>
#include <vector>

namespace CardsTests
{

using namespace DeckLinkAPI;
using namespace VirtualCards;
using VideoInputHAL::QueryInterface;
using VideoInputHAL::TakeReference;
using VideoInputHAL::VComPointer;

constexpr int64_t Scale = 135000000;
constexpr uint32_t Mode1080p25 = FourCharacterCode( "Hp25" );
constexpr uint32_t ModeNTSC = FourCharacterCode( "ntsc" );

inline IVirtualCardControl& DeckLinkControl() { return ControlOf( VIRTUAL_DECKLINK ); }

inline std::string TakeText( const char* i_pText )
{
  const std::string Text = i_pText ? i_pText : "(null)";
  std::free( const_cast<char*>( i_pText ) );
  return Text;
}

// An object of one of the factories that the library exports
template<class TInterface>
VComPointer<TInterface> Make( const char* i_pFactory )
{
  static void* const s_pLibrary = dlopen( VIRTUAL_DECKLINK, RTLD_NOW );
  return TakeReference( reinterpret_cast<TInterface* (*)()>( dlsym( s_pLibrary, i_pFactory ) )() );
}

inline VComPointer<IDeckLinkDiscovery> MakeDiscovery() { return Make<IDeckLinkDiscovery>( "CreateDeckLinkDiscoveryInstance_0001" ); }

// What a frame callback saw
struct VSeen
{
  bool m_bSignal = false;
  uint32_t m_Flags = 0;
  long m_Width = 0;
  long m_Height = 0;
  uint32_t m_PixelFormat = 0;
  std::optional<uint32_t> m_Counter;
  int64_t m_StreamTime = 0;
  int64_t m_HardwareTime = 0;
  int64_t m_Duration = 0;
  std::string m_Timecode;   // of any RP188 packet; empty for none
  uint32_t m_TimecodeFlags = 0;
};

inline KVZ::IPixelFormat::Enum LayoutOf( uint32_t i_PixelFormat )
{
  switch( i_PixelFormat )
  {
    case PixelFormat::YUV8Bit: return KVZ::IPixelFormat::EU8Y8V8Y8;
    case PixelFormat::YUV10Bit: return KVZ::IPixelFormat::EU10Y10V10Y10;
    default: return KVZ::IPixelFormat::EB8G8R8u8;
  }
}

inline TestSupport::VPixels PixelsOf( IDeckLinkVideoInputFrame& i_rFrame )
{
  void* pBytes = nullptr;
  EXPECT_EQ( i_rFrame.GetBytes( &pBytes ), S_OK );
  return { LayoutOf( i_rFrame.GetPixelFormat() ), static_cast<const uint8_t*>( pBytes ), static_cast<size_t>( i_rFrame.GetRowBytes() ) };
}

inline VSeen Look( IDeckLinkVideoInputFrame& i_rFrame )
{
  VSeen Seen;
  Seen.m_Flags = i_rFrame.GetFlags();
  Seen.m_bSignal = !( Seen.m_Flags & FrameFlag::NoInputSource );
  Seen.m_Width = i_rFrame.GetWidth();
  Seen.m_Height = i_rFrame.GetHeight();
  Seen.m_PixelFormat = i_rFrame.GetPixelFormat();
  Seen.m_Counter = ReadCounter( PixelsOf( i_rFrame ) );
  EXPECT_EQ( i_rFrame.GetStreamTime( &Seen.m_StreamTime, &Seen.m_Duration, Scale ), S_OK );
  EXPECT_EQ( i_rFrame.GetHardwareReferenceTimestamp( Scale, &Seen.m_HardwareTime, &Seen.m_Duration ), S_OK );
  IDeckLinkTimecode* pTimecode = nullptr;
  if( i_rFrame.GetTimecode( TimecodeFormat::RP188Any, &pTimecode ) == S_OK )
  {
    const char* pText = nullptr;
    pTimecode->GetString( &pText );
    Seen.m_Timecode = TakeText( pText );
    Seen.m_TimecodeFlags = pTimecode->GetFlags();
    pTimecode->Release();
  }
  return Seen;
}

// A callback object of a client's, which counts the library's references to it.
template<class TInterface>
class VCallbackObject : public TInterface
{
public:
  virtual ~VCallbackObject() = default;

  HRESULT QueryInterface( REFIID, void** o_ppObject ) override
  {
    *o_ppObject = nullptr;
    return E_NOINTERFACE;
  }
  ULONG AddRef() override { return static_cast<ULONG>( ++m_References ); }
  ULONG Release() override { return static_cast<ULONG>( --m_References ); }

  std::atomic<int> m_References{ 1 };
};

// Hands every call to functions that a test sets.
class VClient final : public VCallbackObject<IDeckLinkInputCallback>
{
public:
  HRESULT VideoInputFormatChanged( uint32_t i_Events, IDeckLinkDisplayMode* i_pMode, uint32_t i_Detected ) override
  {
    ++m_FormatCalls;
    m_LastEvents = i_Events;
    m_LastDetected = i_Detected;
    if( m_OnFormat )
    {
      m_OnFormat( i_pMode->GetDisplayMode() );
    }
    return S_OK;
  }

  HRESULT VideoInputFrameArrived( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* i_pPacket ) override
  {
    ++m_FrameCalls;
    if( m_OnFrame )
    {
      m_OnFrame( i_pFrame, i_pPacket );
    }
    return E_FAIL;   // nobody looks at it
  }

  // Keeps what every frame showed, with its content where the bytes of a sample of all channels are given.
  void Record( size_t i_SampleBytes = 0 )
  {
    m_OnFrame = [this, i_SampleBytes]( IDeckLinkVideoInputFrame* i_pFrame, IDeckLinkAudioInputPacket* i_pPacket )
    {
      m_Seen.push_back( Look( *i_pFrame ) );
      m_Packets += i_pPacket ? 1 : 0;
      if( i_SampleBytes > 0 )
      {
        void* pSound = nullptr;
        ASSERT_EQ( i_pPacket->GetBytes( &pSound ), S_OK );
        Append( m_Sound, pSound, static_cast<size_t>( i_pPacket->GetSampleFrameCount() ) * i_SampleBytes );
        Append( m_Video, PixelsOf( *i_pFrame ).m_pBytes, static_cast<size_t>( i_pFrame->GetRowBytes() * i_pFrame->GetHeight() ) );
      }
    };
  }
  static void Append( std::vector<uint8_t>& io_rBytes, const void* i_pMore, size_t i_Size )
  {
    const auto* const pMore = static_cast<const uint8_t*>( i_pMore );
    io_rBytes.insert( io_rBytes.end(), pMore, pMore + i_Size );
  }

  std::function<void( uint32_t )> m_OnFormat;
  std::function<void( IDeckLinkVideoInputFrame*, IDeckLinkAudioInputPacket* )> m_OnFrame;
  std::atomic<int> m_FormatCalls{ 0 };
  std::atomic<int> m_FrameCalls{ 0 };
  uint32_t m_LastEvents = 0;
  uint32_t m_LastDetected = 0;
  std::vector<VSeen> m_Seen;
  int m_Packets = 0;
  std::vector<uint8_t> m_Video;
  std::vector<uint8_t> m_Sound;
};

// One card in the machine, found through the iterator. Whatever a test does, it must leave nothing behind.
class VCardFixture : public VCardsFixture
{
protected:
  VCardFixture() : VCardsFixture( DeckLinkControl() ) {}

  void Plug( const std::string& i_rText, bool i_bManualClock = true )
  {
    AddCard( i_rText, i_bManualClock );
    IDeckLink* pCard = nullptr;
    ASSERT_EQ( Make<IDeckLinkIterator>( "CreateDeckLinkIteratorInstance_0002" )->Next( &pCard ), S_OK );
    m_pCard = TakeReference( pCard );
    m_pInput = QueryInterface<IDeckLinkInput>( *m_pCard, IID_IDeckLinkInput );
    ASSERT_NE( m_pInput, nullptr );
    ASSERT_EQ( m_pInput->SetCallback( &m_Client ), S_OK );
  }

  void Enable( uint32_t i_Mode = Mode1080p25, uint32_t i_PixelFormat = PixelFormat::YUV8Bit, uint32_t i_Flags = InputFlag::Default )
  {
    ASSERT_EQ( m_pInput->EnableVideoInput( i_Mode, i_PixelFormat, i_Flags ), S_OK );
  }

  void Start() { ASSERT_EQ( m_pInput->StartStreams(), S_OK ); }

  // A card that streams its signal, and a client that keeps what it sees of it.
  void Play( const std::string& i_rText )
  {
    Plug( i_rText );
    m_Client.Record();
    Enable();
    Start();
  }

  // What drivers do with a new format, inside the callback. The worst of the results.
  HRESULT Restart( uint32_t i_Mode )
  {
    return std::min( { m_pInput->PauseStreams(), m_pInput->EnableVideoInput( i_Mode, PixelFormat::YUV8Bit, InputFlag::FormatDetection ),
      m_pInput->FlushStreams(), m_pInput->StartStreams() } );
  }
  void RestartOnFormat()
  {
    m_Client.m_OnFormat = [this]( uint32_t i_Mode ) { EXPECT_EQ( Restart( i_Mode ), S_OK ); };
  }

  // A client that lets its card look for the signal's format.
  void StartDetecting()
  {
    Enable( ModeNTSC, PixelFormat::YUV8Bit, InputFlag::FormatDetection );
    Start();
  }

  void TearDown() override
  {
    if( m_pInput )
    {
      m_pInput->StopStreams();
      m_pInput->SetCallback( nullptr );
    }
    EXPECT_EQ( m_Client.m_References, 1 );
    m_pInput.reset();
    m_pCard.reset();
    RemoveCards();
    EXPECT_EQ( Control().ReferencesHeld(), 0 );
    EXPECT_EQ( Control().CallbacksInFlight(), 0 );
  }

  VClient m_Client;
  VComPointer<IDeckLink> m_pCard;
  VComPointer<IDeckLinkInput> m_pInput;
};

}
