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

// The operations stand one behind the other, the first in the given slot; the slot count shows whether a destructor follows.
template<class TInterface, class... TMembers>
void ExpectTable( long i_SlotCount, long i_First, TMembers... i_Members )
{
  const std::vector<long> Found = { Slot( i_Members )... };
  std::vector<long> Expected( Found.size() );
  std::iota( Expected.begin(), Expected.end(), i_First );
  EXPECT_EQ( Found, Expected );
  EXPECT_EQ( SlotCount<TInterface>(), i_SlotCount );
}

// The types that pass the boundary
static_assert( sizeof( HRESULT ) == 4 && sizeof( bool ) == 1 && sizeof( long ) == 8 );
static_assert( std::is_same_v<decltype( &IUnknown::AddRef ), unsigned long ( IUnknown::* )()> && sizeof( ULONG ) == 8 );
static_assert( std::is_same_v<decltype( &IUnknown::Release ), unsigned long ( IUnknown::* )()> );
static_assert( std::is_same_v<decltype( &IUnknown::QueryInterface ), int ( IUnknown::* )( REFIID, void** )> );
static_assert( std::is_trivially_copyable_v<REFIID> );
}

TEST( DeckLinkAPI, OperationsAndDestructorsStandInTheVendorsSlots )
{
  ExpectTable<IUnknown>( 3, 0, &IUnknown::QueryInterface, &IUnknown::AddRef, &IUnknown::Release );
  ExpectTable<IDeckLinkInput>( 21, 3, &IDeckLinkInput::DoesSupportVideoMode, &IDeckLinkInput::GetDisplayModeIterator,
    &IDeckLinkInput::SetScreenPreviewCallback, &IDeckLinkInput::EnableVideoInput, &IDeckLinkInput::DisableVideoInput,
    &IDeckLinkInput::GetAvailableVideoFrameCount, &IDeckLinkInput::SetVideoInputFrameMemoryAllocator, &IDeckLinkInput::EnableAudioInput,
    &IDeckLinkInput::DisableAudioInput, &IDeckLinkInput::GetAvailableAudioSampleFrameCount, &IDeckLinkInput::StartStreams,
    &IDeckLinkInput::StopStreams, &IDeckLinkInput::PauseStreams, &IDeckLinkInput::FlushStreams, &IDeckLinkInput::SetCallback,
    &IDeckLinkInput::GetHardwareReferenceClock );
  ExpectTable<IDeckLinkVideoFrame>( 13, 3, &IDeckLinkVideoFrame::GetWidth, &IDeckLinkVideoFrame::GetHeight, &IDeckLinkVideoFrame::GetRowBytes,
    &IDeckLinkVideoFrame::GetPixelFormat, &IDeckLinkVideoFrame::GetFlags, &IDeckLinkVideoFrame::GetBytes, &IDeckLinkVideoFrame::GetTimecode,
    &IDeckLinkVideoFrame::GetAncillaryData );
  ExpectTable<IDeckLinkVideoInputFrame>( 15, 13, &IDeckLinkVideoInputFrame::GetStreamTime, &IDeckLinkVideoInputFrame::GetHardwareReferenceTimestamp );
  ExpectTable<IDeckLinkInputCallback>( 7, 3, &IDeckLinkInputCallback::VideoInputFormatChanged, &IDeckLinkInputCallback::VideoInputFrameArrived );
  ExpectTable<IDeckLinkAudioInputPacket>( 8, 3, &IDeckLinkAudioInputPacket::GetSampleFrameCount, &IDeckLinkAudioInputPacket::GetBytes,
    &IDeckLinkAudioInputPacket::GetPacketTime );
  ExpectTable<IDeckLinkTimecode>( 10, 3, &IDeckLinkTimecode::GetBCD, &IDeckLinkTimecode::GetComponents, &IDeckLinkTimecode::GetString,
    &IDeckLinkTimecode::GetFlags, &IDeckLinkTimecode::GetTimecodeUserBits );
  ExpectTable<IDeckLinkDiscovery>( 7, 3, &IDeckLinkDiscovery::InstallDeviceNotifications, &IDeckLinkDiscovery::UninstallDeviceNotifications );
  ExpectTable<IDeckLinkDeviceNotificationCallback>( 7, 3, &IDeckLinkDeviceNotificationCallback::DeckLinkDeviceArrived,
    &IDeckLinkDeviceNotificationCallback::DeckLinkDeviceRemoved );
  ExpectTable<IDeckLink>( 7, 3, &IDeckLink::GetModelName, &IDeckLink::GetDisplayName );
  ExpectTable<IDeckLinkIterator>( 4, 3, &IDeckLinkIterator::Next );
  ExpectTable<IDeckLinkAttributes>( 9, 3, &IDeckLinkAttributes::GetFlag, &IDeckLinkAttributes::GetInt, &IDeckLinkAttributes::GetFloat,
    &IDeckLinkAttributes::GetString );
  ExpectTable<IDeckLinkAPIInformation>( 9, 3, &IDeckLinkAPIInformation::GetFlag, &IDeckLinkAPIInformation::GetInt, &IDeckLinkAPIInformation::GetFloat,
    &IDeckLinkAPIInformation::GetString );
  ExpectTable<IDeckLinkDisplayModeIterator>( 6, 3, &IDeckLinkDisplayModeIterator::Next );
  ExpectTable<IDeckLinkDisplayMode>( 12, 3, &IDeckLinkDisplayMode::GetName, &IDeckLinkDisplayMode::GetDisplayMode, &IDeckLinkDisplayMode::GetWidth,
    &IDeckLinkDisplayMode::GetHeight, &IDeckLinkDisplayMode::GetFrameRate, &IDeckLinkDisplayMode::GetFieldDominance,
    &IDeckLinkDisplayMode::GetFlags );
  ExpectTable<IDeckLinkVideoFrameAncillary>( 8, 3, &IDeckLinkVideoFrameAncillary::GetBufferForVerticalBlankingLine,
    &IDeckLinkVideoFrameAncillary::GetPixelFormat, &IDeckLinkVideoFrameAncillary::GetDisplayMode );
  ExpectTable<IDeckLinkMemoryAllocator>( 7, 3, &IDeckLinkMemoryAllocator::AllocateBuffer, &IDeckLinkMemoryAllocator::ReleaseBuffer,
    &IDeckLinkMemoryAllocator::Commit, &IDeckLinkMemoryAllocator::Decommit );
  ExpectTable<IDeckLinkScreenPreviewCallback>( 6, 3, &IDeckLinkScreenPreviewCallback::DrawFrame );
}

}
