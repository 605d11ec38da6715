// A client of the virtual Bluefish444 library as a program with the vendor's library would be: through the exported functions alone.
#pragma once

#include "VendorInterfaces/BlueVelvetLoader.h"
#include "tests/support/CardFixture.h"
#include "tests/support/CounterReader.h"
#include "tests/support/RampReader.h"

#include <boost/thread/thread.hpp>

#include <optional>
#include <string>
#include <vector>

namespace BluefishTests
{

using namespace BlueVelvet;
using namespace VirtualCards;

constexpr uint32_t NoSignal = 46;

inline const VFlatFunctions& Functions()
{
  static const VRuntimeLibrary s_Library( VIRTUAL_BLUEFISH );
  return *s_Library.Functions();
}

// A card object, detached and freed at its end.
class VObject
{
public:
  VObject() : m_Handle( Functions().bfcFactory() ) {}
  ~VObject()
  {
    Functions().bfcDetach( m_Handle );
    Functions().bfcDestroy( m_Handle );
  }
  VObject( const VObject& ) = delete;
  VObject& operator=( const VObject& ) = delete;

  bool Attach( int i_Card ) { return Functions().bfcAttach( m_Handle, i_Card ) == 0; }
  int Count()
  {
    int Count = -1;
    EXPECT_EQ( Functions().bfcEnumerate( m_Handle, &Count ), 0 );
    return Count;
  }
  std::optional<uint32_t> Query( int i_Property )
  {
    uint32_t Value = 0;
    return Functions().bfcQueryCardProperty32( m_Handle, i_Property, &Value ) == 0 ? std::optional( Value ) : std::nullopt;
  }
  bool Set( int i_Property, uint32_t i_Value ) { return Functions().bfcSetCardProperty32( m_Handle, i_Property, i_Value ) == 0; }
  bool Capture( uint32_t i_BufferId ) { return Functions().bfcRenderBufferCapture( m_Handle, i_BufferId ) == 0; }
  std::optional<uint64_t> Wait()
  {
    unsigned long Count = 0;
    return Functions().bfcWaitVideoInputSync( m_Handle, UpdateMethod::Frame, &Count ) == 0 ? std::optional<uint64_t>( Count ) : std::nullopt;
  }
  bool Read( std::vector<uint8_t>& o_rTarget, uint32_t i_BufferId )
  {
    return Functions().bfcSystemBufferRead( m_Handle, o_rTarget.data(), o_rTarget.size(), i_BufferId, 0 ) == 0;
  }
  // From the order in which a client sets up an input.
  void SetUp( uint32_t i_Channel, uint32_t i_MemoryFormat )
  {
    constexpr uint32_t Routings[] = { 0x30000F05, 0x30001006, 0x30001607, 0x30001708 };
    EXPECT_TRUE( Set( Property::DefaultVideoInputChannel, i_Channel ) );
    EXPECT_EQ( Functions().bfcVideoCaptureStop( m_Handle ), 0 );
    EXPECT_TRUE( Set( Property::RoutingMatrix, Routings[i_Channel - InputChannelA] ) );
    EXPECT_TRUE( Set( Property::VideoInputUpdateType, UpdateMethod::Frame ) );
    EXPECT_TRUE( Set( Property::VideoInputMemoryFormat, i_MemoryFormat ) );
    EXPECT_TRUE( Set( Property::VideoInputEngine, VideoEngine::FrameStore ) );
  }

  const VHandle m_Handle;
};

// What a buffer's ancillary data decodes to.
struct VDecoded
{
  bool m_bDone = false;
  VHancDecodeRecord m_Record;
  std::vector<uint8_t> m_Samples;
};

// One card with a clock moved by hand. Whatever a test does, it must leave nothing behind.
class VBluefishFixture : public VCardsFixture
{
protected:
  VBluefishFixture() : VCardsFixture( ControlOf( VIRTUAL_BLUEFISH ) ) {}

  void Plug( const std::string& i_rText, int i_Card = 1 )
  {
    AddCard( i_rText );
    ASSERT_TRUE( m_Object.Attach( i_Card ) );
  }

  // A frame passes while the client waits for it.
  std::optional<uint64_t> Sync()
  {
    std::optional<uint64_t> Count;
    boost::thread Client( [&] { Count = m_Object.Wait(); } );
    while( Counters().m_ClientsWaiting == 0 )
    {
      boost::this_thread::yield();
    }
    Step();
    Client.join();
    return Count;
  }

  // A frame passes while the client is busy; the card's thread waits for it.
  boost::thread PassOne()
  {
    const uint64_t Passed = Counters().m_FramesPassed;
    boost::thread Card( [this] { EXPECT_TRUE( Control().Step( m_Card, 1 ) ); } );
    while( Counters().m_FramesPassed == Passed )
    {
      boost::this_thread::yield();
    }
    return Card;
  }

  // Names a buffer as drivers do.
  void Name( uint32_t i_Buffer )
  {
    EXPECT_TRUE( m_Object.Capture( i_Buffer ) );
    EXPECT_TRUE( m_Object.Capture( i_Buffer | Buffer::Hanc ) );
  }

  // Two syncs, and with the third the first frame is in buffer 0; buffer 1 takes the next.
  void Begin()
  {
    Sync();
    Name( 0 );
    Sync();
    Name( 1 );
    Sync();
  }

  // A card whose first input is captured from.
  void Play( const std::string& i_rText )
  {
    Plug( i_rText );
    m_Object.SetUp( InputChannelA, MemoryFormat::TwoVUY );
    Begin();
  }

  std::vector<uint8_t> ReadImage( uint32_t i_Buffer, uint32_t i_Mode, uint32_t i_MemoryFormat )
  {
    std::vector<uint8_t> Image( BlueVelvetGolden( Functions(), i_Mode, i_MemoryFormat, UpdateMethod::Frame ) );
    EXPECT_TRUE( m_Object.Read( Image, i_Buffer ) );
    return Image;
  }

  // The number in an image of the counter pattern, in U Y V Y.
  std::optional<uint32_t> CounterIn( uint32_t i_Buffer, uint32_t i_Mode )
  {
    const auto Image = ReadImage( i_Buffer, i_Mode, MemoryFormat::TwoVUY );
    return TestSupport::ReadCounter(
      { KVZ::IPixelFormat::EU8Y8V8Y8, Image.data(), BlueVelvetLineBytes( Functions(), i_Mode, MemoryFormat::TwoVUY ) } );
  }

  VDecoded Decode( uint32_t i_Buffer, uint32_t i_ChannelMask, uint32_t i_SampleFlags, uint32_t i_MostSamples )
  {
    VDecoded Decoded;
    std::vector<uint8_t> Hanc( HancBytes );
    EXPECT_TRUE( m_Object.Read( Hanc, i_Buffer | Buffer::DataHanc ) );
    Decoded.m_Samples.assign( size_t{ i_MostSamples } * 16 * 4 + 4, 0xAA );
    Decoded.m_Record.m_pSamples = Decoded.m_Samples.data();
    Decoded.m_Record.m_ChannelMask = i_ChannelMask;
    Decoded.m_Record.m_SampleFlags = i_SampleFlags;
    Decoded.m_Record.m_MostSamples = i_MostSamples;
    Decoded.m_bDone = Functions().bfcDecodeHancFrameEx( m_Object.m_Handle, 33, reinterpret_cast<uint32_t*>( Hanc.data() ), &Decoded.m_Record ) == 0;
    return Decoded;
  }

  void TearDown() override
  {
    Functions().bfcDetach( m_Object.m_Handle );
    RemoveCards();
    EXPECT_EQ( Control().ReferencesHeld(), 1 ) << "the fixture's own";
    EXPECT_EQ( Control().ReleaseErrors(), m_ErrorsBefore );
  }

  const int64_t m_ErrorsBefore = Control().ReleaseErrors();
  VObject m_Object;
};

}
