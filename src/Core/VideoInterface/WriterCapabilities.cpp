#include "Core/VideoInterface/WriterCapabilities.h"

#include <array>

namespace KVZ
{

namespace
{

// A set of small numbers, one bit each.
class VSet
{
public:
  static constexpr VSet All() { return VSet( ~uint32_t{ 0 } ); }

  template<class... T>
  static constexpr VSet Of( T... i_Values )
  {
    return VSet( ( uint32_t{ 0 } | ... | ( uint32_t{ 1 } << i_Values ) ) );
  }

  static constexpr VSet UpTo( uint32_t i_Last ) { return VSet( ( uint32_t{ 2 } << i_Last ) - 1 ); }

  // Everything takes numbers outside the enumeration too.
  template<class T>
  constexpr bool Has( T i_Value ) const
  {
    const auto Value = static_cast<uint32_t>( i_Value );
    return m_Bits == All().m_Bits || ( Value < 32 && ( m_Bits >> Value & 1 ) != 0 );
  }

private:
  explicit constexpr VSet( uint32_t i_Bits ) : m_Bits( i_Bits ) {}

  uint32_t m_Bits;
};

struct VRow
{
  IVideoContainer::Enum m_Container;
  VSet m_VideoPayloads;
  VSet m_PixelFormats;   // of uncompressed video
  VSet m_AudioPayloads;
  VSet m_SampleFormats;   // of uncompressed audio
  VSet m_Channels;
  bool m_bNative;
};

using V = IVideoPayload;
using P = IPixelFormat;
using A = IAudioPayload;
using S = IAudioSampleFormat;

constexpr VSet NoneOrUncompressed = VSet::Of( A::ENone, A::EUncompressed );
constexpr VSet MovVideo = VSet::Of( V::EUncompressed, V::EImageJPEG, V::EImagePNG, V::EImageTIFF, V::EVideoH264 );
constexpr VSet MovPixels = VSet::Of( P::ER8G8B8, P::EB8G8R8, P::ER8G8B8u8, P::EB8G8R8u8, P::EU8Y8V8Y8, P::EY8U8Y8V8, P::EU10Y10V10Y10 );
constexpr VSet MovSamples = VSet::Of( S::EInt16, S::EInt24, S::EInt32, S::EUInt8 );
constexpr VSet AviPixels = VSet::Of( P::ELuminance8, P::EBayerRG8, P::EBayerGB8, P::EBayerGR8, P::EBayerBG8, P::EB8G8R8, P::EB8G8R8u8, P::EU8Y8V8Y8,
  P::EY8U8Y8V8 );
constexpr VSet MkvPixels = VSet::Of( P::ELuminance8, P::EBayerGB8, P::ER8G8B8u8, P::EU8Y8V8Y8, P::EY8U8Y8V8 );

// Each set is exactly what the container's writer can store, irregular as it looks.
constexpr std::array<VRow, VideoContainerCount> Rows = {
  VRow{ IVideoContainer::EMOV, MovVideo, MovPixels, NoneOrUncompressed, MovSamples, VSet::UpTo( 16 ), false },
  VRow{ IVideoContainer::EMP4, MovVideo, MovPixels, NoneOrUncompressed, MovSamples, VSet::UpTo( 16 ), false },
  VRow{ IVideoContainer::EAVI, VSet::Of( V::EUncompressed, V::EImageJPEG ), AviPixels, NoneOrUncompressed,
    VSet::Of( S::EInt16, S::EInt24, S::EInt32, S::EFloat32, S::EUInt8 ), VSet::Of( 1, 2, 3, 4, 8 ), false },
  VRow{ IVideoContainer::ETVID, VSet::Of( V::EUncompressed ), VSet::All(), NoneOrUncompressed, VSet::All(), VSet::UpTo( 16 ), true },
  VRow{ IVideoContainer::EMKV, VSet::Of( V::EUncompressed, V::EImageJPEG ), MkvPixels, NoneOrUncompressed,
    VSet::Of( S::EInt16, S::EInt24, S::EInt32, S::EFloat32 ), VSet::UpTo( 16 ), false },
  VRow{ IVideoContainer::EIMAGES, VSet::Of( V::EImageJPEG, V::EImagePNG, V::EImageTIFF ), VSet::Of( P::ER8G8B8, P::EU8Y8V8Y8 ), VSet::Of( A::ENone ),
    VSet::Of(), VSet::Of(), false },
};

constexpr bool IsIndexedByContainer()
{
  for( size_t Index = 0; Index < Rows.size(); ++Index )
  {
    if( Rows[Index].m_Container != static_cast<int32_t>( Index ) )
    {
      return false;
    }
  }
  return true;
}
static_assert( IsIndexedByContainer() );

template<IVideoContainer::Enum TContainer>
const IVideoWriterCapabilities& Instance()
{
  static const VContainerCapabilities<TContainer> Capabilities;
  return Capabilities;
}

}

template<IVideoContainer::Enum C>
bool VContainerCapabilities<C>::IsAudioSampleFormatSupported( IAudioSampleFormat::Enum i_Format ) const
{
  return Rows[C].m_SampleFormats.Has( i_Format );
}

template<IVideoContainer::Enum C>
bool VContainerCapabilities<C>::IsAudioPayloadSupported( IAudioPayload::Enum i_Payload ) const
{
  return Rows[C].m_AudioPayloads.Has( i_Payload );
}

template<IVideoContainer::Enum C>
bool VContainerCapabilities<C>::IsPixelFormatSupported( IPixelFormat::Enum i_Format ) const
{
  return Rows[C].m_PixelFormats.Has( i_Format );
}

template<IVideoContainer::Enum C>
bool VContainerCapabilities<C>::IsVideoPayloadSupported( IVideoPayload::Enum i_Payload ) const
{
  return Rows[C].m_VideoPayloads.Has( i_Payload );
}

template<IVideoContainer::Enum C>
bool VContainerCapabilities<C>::IsChannelCountSupported( uint32_t i_Channels ) const
{
  return Rows[C].m_Channels.Has( i_Channels );
}

template<IVideoContainer::Enum C>
bool VContainerCapabilities<C>::IsNative() const
{
  return Rows[C].m_bNative;
}

template class VContainerCapabilities<IVideoContainer::EMOV>;
template class VContainerCapabilities<IVideoContainer::EMP4>;
template class VContainerCapabilities<IVideoContainer::EAVI>;
template class VContainerCapabilities<IVideoContainer::ETVID>;
template class VContainerCapabilities<IVideoContainer::EMKV>;
template class VContainerCapabilities<IVideoContainer::EIMAGES>;

const IVideoWriterCapabilities& GetVideoWriterCapabilities( IVideoContainer::Enum i_Container )
{
  switch( i_Container )
  {
    case IVideoContainer::EMOV: return Instance<IVideoContainer::EMOV>();
    case IVideoContainer::EMP4: return Instance<IVideoContainer::EMP4>();
    case IVideoContainer::EAVI: return Instance<IVideoContainer::EAVI>();
    case IVideoContainer::ETVID: return Instance<IVideoContainer::ETVID>();
    case IVideoContainer::EMKV: return Instance<IVideoContainer::EMKV>();
    case IVideoContainer::EIMAGES: return Instance<IVideoContainer::EIMAGES>();
  }
  static const VVideoWriterDummyCapabilities Dummy;
  return Dummy;
}

}
