#include "HardwareSupport/VideoInput/VideoInputDataSource/FrameConversion.h"

#include "CoreVideoUtils/Fonts/FontCells.h"
#include "FileIO/VideoEncoding/VideoFrameEncoder.h"
#include "Utils/UtilsMemory/StandardBufferAllocator.h"

#include <boost/thread/lock_guard.hpp>

#include <utility>

namespace VideoInputHAL
{

using KVZ::IPixelFormat;
using KVZ::IVideoPayload;

VFrameConversion::VFrameConversion( const StageCorePluginInterface::VCaptureTarget& i_rTarget, const VVideoEncoderSettings& i_rSettings )
  : m_Payload( static_cast<IVideoPayload::Enum>( i_rTarget.m_VideoPayload ) ),
    m_WantedFormat( static_cast<IPixelFormat::Enum>( i_rTarget.m_PixelFormat ) ),
    m_bTimecode( i_rTarget.m_bBurnInTimecode ),
    m_bLens( i_rTarget.m_bCorrectLens ),
    m_Lens( i_rTarget.m_Lens ),
    m_Converter( ConverterFor( i_rTarget, i_rSettings ) ),
    m_pAllocator( std::make_shared<KVZ::IStandardBufferAllocator>( "Capture video" ) )
{
}

VFrameConversion::~VFrameConversion() = default;

IPixelFormat::Enum VFrameConversion::FormatFor( IPixelFormat::Enum i_Captured ) const
{
  IPixelFormat::Enum Format = i_Captured;
  if( m_Payload == IVideoPayload::EUncompressed )
  {
    return m_WantedFormat != IPixelFormat::EUnspecified ? m_WantedFormat : i_Captured;
  }
  if( m_bTimecode || m_bLens )
  {
    VideoEncoding::PixelFormatForPayloadFormat( m_Payload, i_Captured, Format );
  }
  return Format;
}

bool VFrameConversion::Apply( const KVZ::ITimecode& i_rTimecode, KVZ::VBufferList& io_rVideo, KVZ::VideoFrameInfo& io_rInfo )
{
  const IPixelFormat::Enum Format = FormatFor( io_rInfo.m_PixelFormat );
  if( !m_bTimecode && !m_bLens && Format == io_rInfo.m_PixelFormat )
  {
    return true;
  }
  std::unique_ptr<VEncoder> pEncoder = TakeEncoder();
  if( m_bTimecode )
  {
    pEncoder->SetBurnIn( BurnInPlaceFor( BurnInTextOf( i_rTimecode ), io_rInfo ) );
  }
  const bool bDone = pEncoder->Encode( *m_pAllocator, io_rVideo, io_rInfo, IVideoPayload::EUncompressed, Format );
  GiveBack( std::move( pEncoder ) );
  io_rInfo.m_PixelFormat = Format;
  return bDone;
}

std::unique_ptr<VideoEncoding::VVideoFrameEncoder> VFrameConversion::TakeEncoder()
{
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( !m_FreeEncoders.empty() )
    {
      std::unique_ptr<VEncoder> pEncoder = std::move( m_FreeEncoders.back() );
      m_FreeEncoders.pop_back();
      return pEncoder;
    }
  }
  return MakeEncoder();
}

// The writer's own encoder knows nothing of the lens, which is undone once.
std::unique_ptr<VideoEncoding::VVideoFrameEncoder> VFrameConversion::MakeEncoder() const
{
  auto pEncoder = std::make_unique<VEncoder>( m_Converter );
  if( m_bLens )
  {
    pEncoder->SetLensCorrection( m_Lens );
    pEncoder->SetLensCorrectionEnabled( true );
  }
  return pEncoder;
}

void VFrameConversion::GiveBack( std::unique_ptr<VEncoder> i_pEncoder )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_FreeEncoders.push_back( std::move( i_pEncoder ) );
}

VideoEncoding::EConverter ConverterFor( const StageCorePluginInterface::VCaptureTarget& i_rTarget, const VVideoEncoderSettings& i_rSettings )
{
  return i_rTarget.m_Converter != 0 ? static_cast<VideoEncoding::EConverter>( i_rTarget.m_Converter ) : i_rSettings.m_Converter;
}

std::string BurnInTextOf( const KVZ::ITimecode& i_rTimecode )
{
  if( !KVZ::IsValid( i_rTimecode ) )
  {
    return "--:--:--:--";
  }
  const KVZ::VTimecodeStandardRow* pStandard = KVZ::FindTimecodeStandard( i_rTimecode.m_Standard );
  const uint32_t FramePeriod = i_rTimecode.m_SubFramePeriod;
  const bool bShared = FramePeriod != 0 && FramePeriod < pStandard->m_Period;
  return KVZ::ToText( i_rTimecode ) + ( bShared ? "." + std::to_string( i_rTimecode.m_TickRemainder / FramePeriod ) : "" );
}

VideoEncoding::VBurnInSettings BurnInPlaceFor( const std::string& i_rText, const KVZ::VideoFrameInfo& i_rInfo )
{
  constexpr uint32_t LinesInPicture = 15;
  VideoEncoding::VBurnInSettings Settings;
  Settings.m_Text = i_rText;
  Settings.m_SizeIndex = 0;
  while( Settings.m_SizeIndex + 1 < CoreVideoUtils::FontCells.size() &&
    CoreVideoUtils::FontCells[Settings.m_SizeIndex + 1].m_Height * LinesInPicture <= i_rInfo.m_ImageHeight )
  {
    ++Settings.m_SizeIndex;
  }
  const CoreVideoUtils::VFontCell& rCell = CoreVideoUtils::FontCells[Settings.m_SizeIndex];
  const uint32_t Width = rCell.m_Width * static_cast<uint32_t>( i_rText.size() );
  // Even, so that text and picture share no chroma in 4:2:2 at its left edge.
  Settings.m_X = i_rInfo.m_ImageWidth > Width ? ( i_rInfo.m_ImageWidth - Width ) / 2 & ~1u : 0;
  Settings.m_Y = i_rInfo.m_ImageHeight > 2 * rCell.m_Height ? rCell.m_Height : 0;
  return Settings;
}

}
