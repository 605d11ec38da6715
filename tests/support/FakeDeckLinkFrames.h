// Frames, sound and timecode of the fake DeckLink runtime, of any content and with any operation failing. Its objects are counted; Live()
// tells of leaks.
#pragma once

#include "VendorInterfaces/DeckLinkAPI.h"

#include <atomic>
#include <cstdint>
#include <map>
#include <set>
#include <string>
#include <vector>

namespace TestSupport::FakeDeckLink
{

using namespace DeckLinkAPI;

inline std::atomic<int> s_LiveObjects{ 0 };
inline int Live() { return s_LiveObjects; }

template<class TInterface>
class VObject : public TInterface
{
public:
  explicit VObject( REFIID i_Id ) : m_Id( i_Id ) { ++s_LiveObjects; }
  VObject( const VObject& ) = delete;
  VObject& operator=( const VObject& ) = delete;

  HRESULT QueryInterface( REFIID i_Id, void** o_ppObject ) override
  {
    const bool bKnown = i_Id == IID_IUnknown || i_Id == m_Id;
    *o_ppObject = bKnown ? static_cast<TInterface*>( this ) : nullptr;
    return bKnown ? ( AddRef(), S_OK ) : E_NOINTERFACE;
  }
  ULONG AddRef() override { return ++m_References; }
  ULONG Release() override
  {
    const ULONG References = --m_References;
    if( References == 0 )
    {
      delete this;
    }
    return References;
  }
  ULONG References() const { return m_References; }

protected:
  ~VObject() override { --s_LiveObjects; }

private:
  const REFIID m_Id;
  std::atomic<ULONG> m_References{ 1 };
};

struct VTimecodeContent
{
  uint8_t m_Hours = 1;
  uint8_t m_Minutes = 0;
  uint8_t m_Seconds = 0;
  uint8_t m_Frames = 0;
  uint32_t m_Flags = 0;
  uint32_t m_UserBits = 0;
};

struct VFrameContent
{
  long m_Width = 48;
  long m_Height = 2;
  long m_RowBytes = 96;
  uint32_t m_PixelFormat = PixelFormat::YUV8Bit;
  uint32_t m_Flags = 0;
  std::vector<uint8_t> m_Bytes = std::vector<uint8_t>( 192, 0x5A );
  int64_t m_Duration = 5400000;   // ticks at 135 MHz
  int64_t m_HardwareTime = 0;     // ticks at 135 MHz: where the frame ends
  std::map<uint32_t, VTimecodeContent> m_Timecodes = {};
  std::set<std::string> m_Failures = {};   // names of operations
};

struct VAudioContent
{
  long m_Samples = 0;
  std::vector<uint8_t> m_Bytes;
  bool m_bBytesFail = false;
};

class VTimecode : public VObject<IDeckLinkTimecode>
{
public:
  explicit VTimecode( const VTimecodeContent& i_rContent ) : VObject( IID_IDeckLinkTimecode ), m_Content( i_rContent ) {}
  uint32_t GetBCD() override { return 0; }
  HRESULT GetComponents( uint8_t* o_pHours, uint8_t* o_pMinutes, uint8_t* o_pSeconds, uint8_t* o_pFrames ) override
  {
    *o_pHours = m_Content.m_Hours;
    *o_pMinutes = m_Content.m_Minutes;
    *o_pSeconds = m_Content.m_Seconds;
    *o_pFrames = m_Content.m_Frames;
    return S_OK;
  }
  HRESULT GetString( const char** ) override { return E_NOTIMPL; }
  uint32_t GetFlags() override { return m_Content.m_Flags; }
  HRESULT GetTimecodeUserBits( uint32_t* o_pUserBits ) override
  {
    *o_pUserBits = m_Content.m_UserBits;
    return S_OK;
  }

private:
  const VTimecodeContent m_Content;
};

class VFrame : public VObject<IDeckLinkVideoInputFrame>
{
public:
  explicit VFrame( const VFrameContent& i_rContent ) : VObject( IID_IDeckLinkVideoInputFrame ), m_Content( i_rContent ) {}
  long GetWidth() override { return m_Content.m_Width; }
  long GetHeight() override { return m_Content.m_Height; }
  long GetRowBytes() override { return m_Content.m_RowBytes; }
  uint32_t GetPixelFormat() override { return m_Content.m_PixelFormat; }
  uint32_t GetFlags() override { return m_Content.m_Flags; }
  HRESULT GetBytes( void** o_ppBuffer ) override
  {
    *o_ppBuffer = m_Content.m_Bytes.data();
    return Result( "GetBytes" );
  }
  // An absent timecode is a success without an object.
  HRESULT GetTimecode( uint32_t i_Format, IDeckLinkTimecode** o_ppTimecode ) override
  {
    const auto Found = m_Content.m_Timecodes.find( i_Format );
    *o_ppTimecode = Found == m_Content.m_Timecodes.end() ? nullptr : new VTimecode( Found->second );
    return *o_ppTimecode ? S_OK : S_FALSE;
  }
  HRESULT GetAncillaryData( IDeckLinkVideoFrameAncillary** ) override { return E_NOTIMPL; }
  HRESULT GetStreamTime( int64_t* o_pFrameTime, int64_t* o_pFrameDuration, int64_t i_TimeScale ) override
  {
    *o_pFrameTime = 0;
    *o_pFrameDuration = m_Content.m_Duration * i_TimeScale / 135000000;
    return Result( "GetStreamTime" );
  }
  HRESULT GetHardwareReferenceTimestamp( int64_t i_TimeScale, int64_t* o_pFrameTime, int64_t* o_pFrameDuration ) override
  {
    *o_pFrameTime = m_Content.m_HardwareTime * i_TimeScale / 135000000;
    *o_pFrameDuration = m_Content.m_Duration * i_TimeScale / 135000000;
    return Result( "GetHardwareReferenceTimestamp" );
  }

private:
  HRESULT Result( const char* i_pOperation ) const { return m_Content.m_Failures.count( i_pOperation ) ? E_FAIL : S_OK; }
  VFrameContent m_Content;
};

class VAudioPacket : public VObject<IDeckLinkAudioInputPacket>
{
public:
  explicit VAudioPacket( const VAudioContent& i_rContent ) : VObject( IID_IDeckLinkAudioInputPacket ), m_Content( i_rContent ) {}
  long GetSampleFrameCount() override { return m_Content.m_Samples; }
  HRESULT GetBytes( void** o_ppBuffer ) override
  {
    *o_ppBuffer = m_Content.m_Bytes.data();
    return m_Content.m_bBytesFail ? E_FAIL : S_OK;
  }
  HRESULT GetPacketTime( int64_t*, int64_t ) override { return S_OK; }

private:
  VAudioContent m_Content;
};

}
