// The Bluefish444 library as a fake at its flat functions: cards that a test describes, and a capture thread that a test lets go from rest to rest.
//
// A thread rests where the card makes it wait for a sync, and in the device's pause. Resume lets it run to its next rest, so that whatever it does
// between two syncs has been done when Resume returns. Freely lets every rest pass, for tests about threads.
#pragma once

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "VendorInterfaces/BlueVelvet.h"

#include <boost/thread/condition_variable.hpp>
#include <boost/thread/lock_guard.hpp>
#include <boost/thread/lock_types.hpp>
#include <boost/thread/mutex.hpp>
#include <boost/thread/thread.hpp>

#include <atomic>
#include <chrono>
#include <cstdio>
#include <cstring>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <set>
#include <string>
#include <utility>
#include <vector>

namespace TestSupport::FakeBlueVelvet
{

using namespace BlueVelvet;

// Sizes of every mode but the invalid one. The card copies a page where an image has 128 bytes.
constexpr uint32_t Width = 8;
constexpr uint32_t Lines = 8;
constexpr uint32_t LineBytes = 16;
constexpr uint32_t ImageBytes = Lines * LineBytes;

constexpr uint64_t FieldsBefore = 1000;   // that have passed when a test begins

class VCard
{
public:
  int m_Type = 27;
  std::map<int, uint32_t> m_Properties{ { Property::ProductId, 4 }, { Property::InvalidVideoModeFlag, 46 }, { Property::CardFeatureStreamInfo, 0x10 },
    { Property::CardFeatureConnectorInfo, 0x10 } };   // one that is missing fails
  bool m_bAttaches = true;
  std::set<uint32_t> m_DeadInputs;   // channels that cannot be chosen

  // The signal
  std::atomic<uint32_t> m_Mode{ 46 };
  std::atomic<bool> m_bLost{ false };   // waits fail at once
  std::atomic<uint32_t> m_FieldsAFrame{ 2 };

  // What the ancillary data decodes to; set while the thread rests
  bool m_bDecodes = true;
  bool m_bReads = true;
  std::optional<uint32_t> m_Samples;   // of each channel; empty: as many as there is room for
  std::map<uint32_t, uint64_t> m_Timecodes;
  VHancDecodeRecord m_LastRecord;   // as the decoder was given it

  std::vector<std::string> TakeCalls()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    return std::exchange( m_Calls, {} );
  }
  void Log( const char* i_pName, std::initializer_list<uint64_t> i_Numbers = {} )
  {
    std::string Text = i_pName;
    char Number[24];
    for( const uint64_t Value : i_Numbers )
    {
      std::snprintf( Number, sizeof( Number ), " %llX", static_cast<unsigned long long>( Value ) );
      Text += Number;
    }
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_Calls.push_back( Text );
  }

  // Where the thread rests: "sync", or the milliseconds of a pause.
  std::string WaitForRest() NO_LOCK_ANALYSIS
  {
    boost::unique_lock<boost::mutex> Lock( m_Mutex );
    m_Changed.wait( Lock, [this]() NO_LOCK_ANALYSIS { return !m_Rest.empty() && !m_bGo; } );
    return m_Rest;
  }
  std::string Resume()
  {
    WaitForRest();
    Release();
    return WaitForRest();
  }
  // Lets the thread go without waiting for its next rest.
  void Release()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bGo = true;
    m_Changed.notify_all();
  }
  void Freely()
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bFree = true;
    m_Changed.notify_all();
  }
  void Rest( const std::string& i_rPlace ) NO_LOCK_ANALYSIS
  {
    boost::unique_lock<boost::mutex> Lock( m_Mutex );
    m_Rest = i_rPlace;
    m_Changed.notify_all();
    m_Changed.wait( Lock, [this]() NO_LOCK_ANALYSIS { return m_bGo || m_bFree; } );
    m_bGo = false;
    m_Rest.clear();
  }

  uint64_t NextFieldCount() { return m_FieldCount += m_FieldsAFrame; }

private:
  boost::mutex m_Mutex;
  boost::condition_variable m_Changed;
  std::vector<std::string> m_Calls GUARDED_BY( m_Mutex );
  std::string m_Rest GUARDED_BY( m_Mutex );
  bool m_bGo GUARDED_BY( m_Mutex ) = false;
  bool m_bFree GUARDED_BY( m_Mutex ) = false;
  std::atomic<uint64_t> m_FieldCount{ FieldsBefore };
};

struct VObject
{
  VCard* m_pCard = nullptr;
};

// The cards in the machine, and the card objects that are alive.
inline std::vector<VCard*> s_Cards;
inline std::atomic<int> s_Objects{ 0 };

inline VCard* CardOf( VHandle i_Handle ) { return static_cast<VObject*>( i_Handle )->m_pCard; }

inline BErr Attach( VHandle i_Handle, int i_Device )
{
  VCard* const pCard = s_Cards.at( static_cast<size_t>( i_Device ) - 1 );
  static_cast<VObject*>( i_Handle )->m_pCard = pCard->m_bAttaches ? pCard : nullptr;
  return pCard->m_bAttaches ? 0 : 1;
}

inline BErr Query( VHandle i_Handle, int i_Property, uint32_t* io_pValue )
{
  VCard& rCard = *CardOf( i_Handle );
  rCard.Log( "Query", { static_cast<uint64_t>( i_Property ) } );
  if( i_Property == Property::VideoInputSignalVideoMode )
  {
    *io_pValue = rCard.m_Mode;
    return 0;
  }
  const auto Found = rCard.m_Properties.find( i_Property );
  *io_pValue = Found != rCard.m_Properties.end() ? Found->second : *io_pValue;
  return Found != rCard.m_Properties.end() ? 0 : 1;
}

inline BErr Set( VHandle i_Handle, int i_Property, uint32_t i_Value )
{
  VCard& rCard = *CardOf( i_Handle );
  rCard.Log( "Set", { static_cast<uint64_t>( i_Property ), i_Value } );
  return i_Property == Property::DefaultVideoInputChannel && rCard.m_DeadInputs.contains( i_Value ) ? 1 : 0;
}

inline BErr Wait( VHandle i_Handle, unsigned long, unsigned long* o_pFieldCount )
{
  VCard& rCard = *CardOf( i_Handle );
  rCard.Log( "Wait" );
  if( rCard.m_bLost )
  {
    return 1;
  }
  rCard.Rest( "sync" );
  *o_pFieldCount = rCard.NextFieldCount();
  return rCard.m_bLost ? 1 : 0;
}

// An image's bytes are the buffer's number, one behind the other.
inline BErr Read( VHandle i_Handle, unsigned char* o_pTarget, unsigned long i_Size, unsigned long i_BufferId, unsigned long )
{
  VCard& rCard = *CardOf( i_Handle );
  rCard.Log( "Read", { i_BufferId, i_Size } );
  std::memset( o_pTarget, static_cast<int>( i_BufferId & Buffer::NumberMask ), i_Size );
  return rCard.m_bReads ? 0 : 1;
}

inline BErr Decode( VHandle i_Handle, uint32_t i_CardType, uint32_t*, VHancDecodeRecord* io_pRecord )
{
  VCard& rCard = *CardOf( i_Handle );
  rCard.Log( "Decode", { i_CardType } );
  rCard.m_LastRecord = *io_pRecord;
  const uint32_t Channels = static_cast<uint32_t>( __builtin_popcount( io_pRecord->m_ChannelMask ) );
  const uint32_t Bytes = io_pRecord->m_SampleFlags == SampleFlag::Bits16 ? 2 : io_pRecord->m_SampleFlags == SampleFlag::Bits24 ? 3 : 4;
  io_pRecord->m_Samples = rCard.m_Samples.value_or( io_pRecord->m_MostSamples ) * Channels;
  std::memset( io_pRecord->m_pSamples, 0x5A, size_t{ io_pRecord->m_Samples } * Bytes );
  for( const auto& [Place, Word] : rCard.m_Timecodes )
  {
    io_pRecord->m_Timecodes[Place] = Word;
  }
  return rCard.m_bDecodes ? 0 : 1;
}

inline BErr GetVideoInfo( int i_Mode, int, int, uint32_t* o_pWidth, uint32_t* o_pHeight, uint32_t* o_pLine, uint32_t* o_pFrame, uint32_t* o_pGolden )
{
  *o_pWidth = Width;
  *o_pHeight = Lines;
  *o_pLine = LineBytes;
  *o_pFrame = ImageBytes;
  *o_pGolden = 3 * 4096;   // more than one image's pages
  return i_Mode == 46 ? 1 : 0;
}

inline const VFlatFunctions& Functions()
{
  static const VFlatFunctions s_Functions{
    .bfcFactory = []() -> VHandle
    {
      ++s_Objects;
      return new VObject;
    },
    .bfcDestroy =
      []( VHandle i_Handle )
    {
      --s_Objects;
      delete static_cast<VObject*>( i_Handle );
    },
    .bfcEnumerate = []( VHandle, int* o_pCount ) -> BErr
    {
      *o_pCount = static_cast<int>( s_Cards.size() );
      return 0;
    },
    .bfcAttach = Attach,
    .bfcDetach = []( VHandle ) -> BErr { return 0; },
    .bfcQueryCardType = []( VHandle i_Handle, int* o_pType, int ) -> BErr
    {
      *o_pType = CardOf( i_Handle )->m_Type;
      return 0;
    },
    .bfcQueryCardProperty32 = Query,
    .bfcSetCardProperty32 = Set,
    .bfcVideoCaptureStop = []( VHandle i_Handle ) -> BErr
    {
      CardOf( i_Handle )->Log( "Stop" );
      return 0;
    },
    .bfcWaitVideoInputSync = Wait,
    .bfcRenderBufferCapture = []( VHandle i_Handle, unsigned long i_BufferId ) -> BErr
    {
      CardOf( i_Handle )->Log( "Capture", { i_BufferId } );
      return 0;
    },
    .bfcSystemBufferRead = Read,
    .bfcDecodeHancFrameEx = Decode,
    .bfcGetVideoInfo = GetVideoInfo,
  };
  return s_Functions;
}

}
