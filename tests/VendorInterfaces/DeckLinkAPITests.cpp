// The vendor's binary interface: ids, table slots and the types that pass, against facts written out again here.
#include "VendorInterfaces/DeckLinkAPI.h"

#include <gtest/gtest.h>

#include <iomanip>
#include <numeric>
#include <sstream>
#include <type_traits>
#include <vector>

using namespace DeckLinkAPI;

namespace
{

// A pointer to a virtual member function holds 1 plus the byte offset in the table (Itanium C++ ABI 2.3).
template<class TMember>
long Slot( TMember i_pMember )
{
  static_assert( sizeof( TMember ) == 2 * sizeof( void* ) );
  uintptr_t Representation = 0;
  std::memcpy( &Representation, &i_pMember, sizeof( Representation ) );
  EXPECT_EQ( Representation % sizeof( void* ), 1u ) << "not virtual";
  return static_cast<long>( Representation / sizeof( void* ) );
}

// The operations stand one behind the other, the first in this slot.
template<class... TMembers>
void ExpectSlots( long i_First, TMembers... i_Members )
{
  const std::vector<long> Found = { Slot( i_Members )... };
  std::vector<long> Expected( Found.size() );
  std::iota( Expected.begin(), Expected.end(), i_First );
  EXPECT_EQ( Found, Expected );
}

// The slot that an operation added by a derived class gets: it counts all slots of the base, its destructor's two included.
template<class TInterface>
long SlotCount()
{
  struct VDerived : TInterface
  {
    virtual void Added() = 0;
  };
  return Slot( &VDerived::Added );
}

std::string ToHex( const REFIID& i_rId )
{
  std::ostringstream Text;
  for( unsigned char Byte : i_rId.m_Bytes )
  {
    Text << std::hex << std::uppercase << std::setw( 2 ) << std::setfill( '0' ) << unsigned{ Byte };
  }
  return Text.str();
}

// The types that pass the boundary
static_assert( sizeof( HRESULT ) == 4 && sizeof( bool ) == 1 && sizeof( long ) == 8 );
static_assert( std::is_same_v<decltype( &IUnknown::AddRef ), unsigned long ( IUnknown::* )()> && sizeof( ULONG ) == 8 );
static_assert( std::is_same_v<decltype( &IUnknown::Release ), unsigned long ( IUnknown::* )()> );
static_assert( std::is_same_v<decltype( &IUnknown::QueryInterface ), int ( IUnknown::* )( REFIID, void** )> );
static_assert( std::is_trivially_copyable_v<REFIID> );
static_assert(
  std::is_same_v<decltype( &IDeckLinkVideoInputFrame::GetStreamTime ), int ( IDeckLinkVideoInputFrame::* )( int64_t*, int64_t*, int64_t )> );
static_assert( std::is_same_v<decltype( &IDeckLinkVideoInputFrame::GetHardwareReferenceTimestamp ),
  int ( IDeckLinkVideoInputFrame::* )( int64_t, int64_t*, int64_t* )> );
static_assert( std::is_same_v<decltype( &IDeckLinkAudioInputPacket::GetPacketTime ), int ( IDeckLinkAudioInputPacket::* )( int64_t*, int64_t )> );
static_assert( std::is_same_v<decltype( &IDeckLinkAudioInputPacket::GetSampleFrameCount ), long ( IDeckLinkAudioInputPacket::* )()> );
static_assert( std::is_same_v<decltype( &IDeckLinkVideoFrame::GetRowBytes ), long ( IDeckLinkVideoFrame::* )()> );
static_assert( std::is_same_v<decltype( &IDeckLinkAttributes::GetFlag ), int ( IDeckLinkAttributes::* )( uint32_t, bool* )> );
static_assert(
  std::is_same_v<decltype( &IDeckLinkTimecode::GetComponents ), int ( IDeckLinkTimecode::* )( uint8_t*, uint8_t*, uint8_t*, uint8_t* )> );
static_assert( std::is_same_v<decltype( &IDeckLinkInput::DoesSupportVideoMode ),
  int ( IDeckLinkInput::* )( uint32_t, uint32_t, uint32_t, uint32_t*, IDeckLinkDisplayMode** )> );
static_assert( std::is_same_v<decltype( &IDeckLinkInput::EnableAudioInput ), int ( IDeckLinkInput::* )( uint32_t, uint32_t, uint32_t )> );
static_assert(
  std::is_same_v<decltype( &IDeckLinkInput::GetHardwareReferenceClock ), int ( IDeckLinkInput::* )( int64_t, int64_t*, int64_t*, int64_t* )> );

}

TEST( DeckLinkAPI, InterfaceIdsAreThePrintedDigitsInOrder )
{
  EXPECT_EQ( ToHex( IID_IUnknown ), "0000000000000000C000000000000046" );
  EXPECT_EQ( ToHex( IID_IDeckLinkDiscovery ), "CDBF631CBC7645FAB44DC55059BC6101" );
  EXPECT_EQ( ToHex( IID_IDeckLinkDeviceNotificationCallback ), "4997053B0ADF4CC8AC707A50C4BE728F" );
  EXPECT_EQ( ToHex( IID_IDeckLink ), "C418FBDD058748ED8FE5640F0A14AF91" );
  EXPECT_EQ( ToHex( IID_IDeckLinkAttributes ), "ABC11843D96644CB96E2A1CB5D3135C4" );
  EXPECT_EQ( ToHex( IID_IDeckLinkProfileAttributes ), "17D4BF8E4911473A80A0731CF6FF345B" );
  EXPECT_EQ( ToHex( IID_IDeckLinkInput ), "AF22762BDFAC4846AA79FA8883560995" );
  EXPECT_EQ( ToHex( IID_IDeckLinkInputCallback ), "DD04E5EC741542ABAE4AE80C4DFC044A" );
  EXPECT_EQ( ToHex( IID_IDeckLinkDisplayModeIterator ), "9C88499FF6014021B80B032E4EB41C35" );
  EXPECT_EQ( ToHex( IID_IDeckLinkDisplayMode ), "3EB2C1AB0A3D4523A3ADF40D7FB14E78" );
  EXPECT_EQ( ToHex( IID_IDeckLinkVideoFrame ), "3F716FE0F0234111BE5DEF4414C05B17" );
  EXPECT_EQ( ToHex( IID_IDeckLinkVideoInputFrame ), "05CFE374537C40949A57680525118F44" );
  EXPECT_EQ( ToHex( IID_IDeckLinkAudioInputPacket ), "E43D5870289411DE8C300800200C9A66" );
  EXPECT_EQ( ToHex( IID_IDeckLinkTimecode ), "BC6CFBD383174325AC1C1216391E9340" );
  EXPECT_EQ( ToHex( IID_IDeckLinkVideoFrameAncillary ), "732E723CD1A44E299E8E4A88797A0004" );
  EXPECT_EQ( ToHex( IID_IDeckLinkIterator ), "50FB36CD30634B73BDBB958087F2D8BA" );
  EXPECT_EQ( ToHex( IID_IDeckLinkAPIInformation ), "7BEA3C68730D4322AF348A7152B532A4" );
  EXPECT_EQ( ToHex( IID_IDeckLinkMemoryAllocator ), "B36EB6E79D294AA892EF843B87A289E8" );
  EXPECT_EQ( ToHex( IID_IDeckLinkScreenPreviewCallback ), "B1D3F49A85FE4C5D95C80B5D5DCCD438" );
}

TEST( DeckLinkAPI, OperationsStandInTheVendorsSlots )
{
  ExpectSlots( 0, &IUnknown::QueryInterface, &IUnknown::AddRef, &IUnknown::Release );
  ExpectSlots( 3, &IDeckLinkInput::DoesSupportVideoMode, &IDeckLinkInput::GetDisplayModeIterator, &IDeckLinkInput::SetScreenPreviewCallback,
    &IDeckLinkInput::EnableVideoInput, &IDeckLinkInput::DisableVideoInput, &IDeckLinkInput::GetAvailableVideoFrameCount,
    &IDeckLinkInput::SetVideoInputFrameMemoryAllocator, &IDeckLinkInput::EnableAudioInput, &IDeckLinkInput::DisableAudioInput,
    &IDeckLinkInput::GetAvailableAudioSampleFrameCount, &IDeckLinkInput::StartStreams, &IDeckLinkInput::StopStreams, &IDeckLinkInput::PauseStreams,
    &IDeckLinkInput::FlushStreams, &IDeckLinkInput::SetCallback, &IDeckLinkInput::GetHardwareReferenceClock );
  ExpectSlots( 3, &IDeckLinkVideoFrame::GetWidth, &IDeckLinkVideoFrame::GetHeight, &IDeckLinkVideoFrame::GetRowBytes,
    &IDeckLinkVideoFrame::GetPixelFormat, &IDeckLinkVideoFrame::GetFlags, &IDeckLinkVideoFrame::GetBytes, &IDeckLinkVideoFrame::GetTimecode,
    &IDeckLinkVideoFrame::GetAncillaryData );
  ExpectSlots( 13, &IDeckLinkVideoInputFrame::GetStreamTime, &IDeckLinkVideoInputFrame::GetHardwareReferenceTimestamp );
  ExpectSlots( 3, &IDeckLinkInputCallback::VideoInputFormatChanged, &IDeckLinkInputCallback::VideoInputFrameArrived );
  ExpectSlots( 3, &IDeckLinkAudioInputPacket::GetSampleFrameCount, &IDeckLinkAudioInputPacket::GetBytes, &IDeckLinkAudioInputPacket::GetPacketTime );
  ExpectSlots( 3, &IDeckLinkTimecode::GetBCD, &IDeckLinkTimecode::GetComponents, &IDeckLinkTimecode::GetString, &IDeckLinkTimecode::GetFlags,
    &IDeckLinkTimecode::GetTimecodeUserBits );
  ExpectSlots( 3, &IDeckLinkDiscovery::InstallDeviceNotifications, &IDeckLinkDiscovery::UninstallDeviceNotifications );
  ExpectSlots( 3, &IDeckLinkDeviceNotificationCallback::DeckLinkDeviceArrived, &IDeckLinkDeviceNotificationCallback::DeckLinkDeviceRemoved );
  ExpectSlots( 3, &IDeckLink::GetModelName, &IDeckLink::GetDisplayName );
  ExpectSlots( 3, &IDeckLinkIterator::Next );
  ExpectSlots( 3, &IDeckLinkAttributes::GetFlag, &IDeckLinkAttributes::GetInt, &IDeckLinkAttributes::GetFloat, &IDeckLinkAttributes::GetString );
  ExpectSlots( 3, &IDeckLinkAPIInformation::GetFlag );
  ExpectSlots( 6, &IDeckLinkAPIInformation::GetString );
  ExpectSlots( 3, &IDeckLinkDisplayModeIterator::Next );
  ExpectSlots( 3, &IDeckLinkDisplayMode::GetName, &IDeckLinkDisplayMode::GetDisplayMode, &IDeckLinkDisplayMode::GetWidth,
    &IDeckLinkDisplayMode::GetHeight, &IDeckLinkDisplayMode::GetFrameRate, &IDeckLinkDisplayMode::GetFieldDominance,
    &IDeckLinkDisplayMode::GetFlags );
  ExpectSlots( 3, &IDeckLinkVideoFrameAncillary::GetBufferForVerticalBlankingLine, &IDeckLinkVideoFrameAncillary::GetPixelFormat,
    &IDeckLinkVideoFrameAncillary::GetDisplayMode );
  ExpectSlots( 3, &IDeckLinkMemoryAllocator::AllocateBuffer, &IDeckLinkMemoryAllocator::ReleaseBuffer, &IDeckLinkMemoryAllocator::Commit,
    &IDeckLinkMemoryAllocator::Decommit );
  ExpectSlots( 3, &IDeckLinkScreenPreviewCallback::DrawFrame );
}

TEST( DeckLinkAPI, DestructorsTakeTwoSlotsWhereTheVendorHasThem )
{
  EXPECT_EQ( SlotCount<IUnknown>(), 3 );
  EXPECT_EQ( SlotCount<IDeckLinkIterator>(), 4 );
  EXPECT_EQ( SlotCount<IDeckLinkMemoryAllocator>(), 7 );
  EXPECT_EQ( SlotCount<IDeckLinkDiscovery>(), 7 );
  EXPECT_EQ( SlotCount<IDeckLinkDeviceNotificationCallback>(), 7 );
  EXPECT_EQ( SlotCount<IDeckLink>(), 7 );
  EXPECT_EQ( SlotCount<IDeckLinkAttributes>(), 9 );
  EXPECT_EQ( SlotCount<IDeckLinkAPIInformation>(), 9 );
  EXPECT_EQ( SlotCount<IDeckLinkInput>(), 21 );
  EXPECT_EQ( SlotCount<IDeckLinkInputCallback>(), 7 );
  EXPECT_EQ( SlotCount<IDeckLinkDisplayModeIterator>(), 6 );
  EXPECT_EQ( SlotCount<IDeckLinkDisplayMode>(), 12 );
  EXPECT_EQ( SlotCount<IDeckLinkVideoFrame>(), 13 );
  EXPECT_EQ( SlotCount<IDeckLinkVideoInputFrame>(), 15 );
  EXPECT_EQ( SlotCount<IDeckLinkAudioInputPacket>(), 8 );
  EXPECT_EQ( SlotCount<IDeckLinkTimecode>(), 10 );
  EXPECT_EQ( SlotCount<IDeckLinkVideoFrameAncillary>(), 8 );
  EXPECT_EQ( SlotCount<IDeckLinkScreenPreviewCallback>(), 6 );
}
