// The vendor's binary interface: table slots and the types that pass.
#include "VendorInterfaces/DeckLinkAPI.h"

#include <gtest/gtest.h>

#include <numeric>
#include <type_traits>
#include <vector>

namespace DeckLinkAPI
{

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

// The types that pass the boundary
static_assert( sizeof( HRESULT ) == 4 && sizeof( bool ) == 1 && sizeof( long ) == 8 );
static_assert( std::is_same_v<decltype( &IUnknown::AddRef ), unsigned long ( IUnknown::* )()> && sizeof( ULONG ) == 8 );
static_assert( std::is_same_v<decltype( &IUnknown::Release ), unsigned long ( IUnknown::* )()> );
static_assert( std::is_same_v<decltype( &IUnknown::QueryInterface ), int ( IUnknown::* )( REFIID, void** )> );
static_assert( std::is_trivially_copyable_v<REFIID> );
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

}
