#include "FileIO/VideoEncoding/VideoFrameEncoder.h"

#include "Core/VideoInterface/EnumTable.h"
#include "CoreVideoUtils/FrameSize.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <cstring>
#include <optional>

namespace VideoEncoding
{

namespace
{

using KVZ::IPixelFormat;
using KVZ::IVideoPayload;

bool IsColour( IPixelFormat::Enum i_Format )
{
  return i_Format == IPixelFormat::ER8G8B8 || i_Format == IPixelFormat::EB8G8R8 || i_Format == IPixelFormat::ER8G8B8u8 ||
    i_Format == IPixelFormat::EB8G8R8u8;
}

bool IsGrey( IPixelFormat::Enum i_Format )
{
  return i_Format == IPixelFormat::ELuminance8 || i_Format == IPixelFormat::ELuminance7 || i_Format == IPixelFormat::ELuminance6;
}

// Nothing for a payload that cannot be encoded.
std::optional<IPixelFormat::Enum> FindStoredFormat( IVideoPayload::Enum i_Payload, IPixelFormat::Enum i_Source )
{
  switch( i_Payload )
  {
    case IVideoPayload::ENone: return IPixelFormat::EUnspecified;
    case IVideoPayload::EUncompressed: return i_Source;
    case IVideoPayload::EImageJPEG: return IsColour( i_Source ) || i_Source == IPixelFormat::ELuminance8 ? i_Source : IPixelFormat::ER8G8B8;
    case IVideoPayload::EImagePNG:
    case IVideoPayload::EImageTIFF: return IsGrey( i_Source ) ? IPixelFormat::ELuminance8 : IPixelFormat::ER8G8B8;
    default: return std::nullopt;
  }
}

// What the steps before compression work towards. A payload that no compressor takes keeps the frame as it is until it is refused.
IPixelFormat::Enum TargetFormat( IVideoPayload::Enum i_Payload, IPixelFormat::Enum i_Source, IPixelFormat::Enum i_Wanted )
{
  if( i_Payload == IVideoPayload::EUncompressed )
  {
    return i_Wanted;
  }
  const IPixelFormat::Enum Stored = FindStoredFormat( i_Payload, i_Source ).value_or( IPixelFormat::EUnspecified );
  return Stored == IPixelFormat::EUnspecified ? i_Source : Stored;
}

void ReportUnsupported( IVideoPayload::Enum i_Payload )
{
  KVZ_LOG_ERROR( "VideoEncoding", "Unsupported video payload format '%s'.", KVZ::NameOrUnspecified( i_Payload ) );
}

// Whatever is not one of the first two is the third. A build without OpenGL has the second alone.
std::shared_ptr<KVZ::IPixelFormatConverter> MakeConverter( EConverter i_Converter, const VEncoderParts& i_rParts )
{
  const bool bNamed = i_Converter == EConverter::OpenGLFirst || i_Converter == EConverter::Software;
  auto Found = i_rParts.m_ConverterMakers.find( bNamed ? i_Converter : EConverter::OpenGLSecond );
  if( Found == i_rParts.m_ConverterMakers.end() && i_Converter != EConverter::Software )
  {
    KVZ_LOG_WARNING( "VideoEncoding", "There is no OpenGL in this build: pixel formats are converted in software." );
    Found = i_rParts.m_ConverterMakers.find( EConverter::Software );
  }
  return Found == i_rParts.m_ConverterMakers.end() ? nullptr : Found->second();
}

// What a compressor has made.
class VCompressedBuffer : public KVZ::IBuffer
{
public:
  uint8_t* Data() override { return m_Bytes.data(); }
  const uint8_t* Data() const override { return m_Bytes.data(); }
  size_t Size() const override { return m_Bytes.size(); }

  UtilsMemory::VByteVector& Bytes() { return m_Bytes; }

private:
  UtilsMemory::VByteVector m_Bytes;
};

}

VEncoderParts& DefaultEncoderParts()
{
  static VEncoderParts s_Parts;
  return s_Parts;
}

bool PixelFormatForPayloadFormat( IVideoPayload::Enum i_Payload, IPixelFormat::Enum i_Source, IPixelFormat::Enum& o_rStored )
{
  const auto Stored = FindStoredFormat( i_Payload, i_Source );
  if( !Stored )
  {
    ReportUnsupported( i_Payload );
    return false;
  }
  o_rStored = *Stored;
  return true;
}

// One frame on its way through the encoder.
struct VVideoFrameEncoder::VJob
{
  KVZ::IBufferAllocator& m_rAllocator;
  KVZ::VBufferList& m_rVideo;
  const KVZ::VideoFrameInfo& m_rSource;
  KVZ::VideoFrameInfo m_Target;   // the source's description with the target's pixel format
  IVideoPayload::Enum m_Payload;
  std::shared_ptr<KVZ::IBuffer> m_pOwn{};   // what was allocated for this frame and may be drawn into

  void Replace( std::shared_ptr<KVZ::IBuffer> i_pBuffer )
  {
    m_rVideo.assign( 1, i_pBuffer );
    m_pOwn = std::move( i_pBuffer );
  }
};

VVideoFrameEncoder::VVideoFrameEncoder( EConverter i_Converter, const VEncoderParts& i_rParts )
  : m_Parts( i_rParts ), m_pConverter( MakeConverter( i_Converter, i_rParts ) )
{
}

void VVideoFrameEncoder::SetColour( const KVZ::VColourRecord& i_rColour )
{
  if( m_pConverter )
  {
    m_pConverter->SetColourCorrection( i_rColour );
  }
}

void VVideoFrameEncoder::SetLensCorrection( const KVZ::VLensDistortionRecord& i_rLens )
{
  if( m_pConverter )
  {
    m_pConverter->SetLensCorrection( i_rLens );
  }
}

void VVideoFrameEncoder::SetLensCorrectionEnabled( bool i_bEnabled )
{
  m_bForceConversion = i_bEnabled;
  if( m_pConverter )
  {
    m_pConverter->SetLensCorrectionEnabled( i_bEnabled );
  }
}

bool VVideoFrameEncoder::Encode( KVZ::IBufferAllocator& i_rAllocator, KVZ::VBufferList& io_rVideo, const KVZ::VideoFrameInfo& i_rInfo,
  IVideoPayload::Enum i_Payload, IPixelFormat::Enum i_PixelFormat ) const
{
  if( io_rVideo.empty() )
  {
    return false;
  }
  VJob Job{ i_rAllocator, io_rVideo, i_rInfo, i_rInfo, i_Payload };
  Job.m_Target.m_PixelFormat = TargetFormat( i_Payload, i_rInfo.m_PixelFormat, i_PixelFormat );
  const bool bUncompressed = i_Payload == IVideoPayload::EUncompressed;
  const bool bConvert = m_bForceConversion || Job.m_Target.m_PixelFormat != i_rInfo.m_PixelFormat;
  const bool bDraw = !m_BurnIn.m_Text.empty();
  if( io_rVideo.size() > 1 && ( bConvert || bDraw || !bUncompressed ) && !Join( Job ) )
  {
    return false;
  }
  if( ( bConvert && !ConvertPixels( Job ) ) || ( bDraw && !DrawText( Job ) ) )
  {
    return false;
  }
  return bUncompressed || Compress( Job );
}

bool VVideoFrameEncoder::Join( VJob& io_rJob ) const
{
  const uint64_t Size = CoreVideoUtils::GetFrameSize( io_rJob.m_rSource );
  if( KVZ::GetTotalSize( io_rJob.m_rVideo ) != Size )
  {
    KVZ_LOG_ERROR( "VideoEncoding", "Unexpected buffer size when copying frame data to make contiguous." );
    return false;
  }
  std::shared_ptr<KVZ::IBuffer> pWhole = io_rJob.m_rAllocator.Allocate( Size );
  if( !pWhole )
  {
    return false;
  }
  uint8_t* pTarget = pWhole->Data();
  for( const auto& rpBuffer : io_rJob.m_rVideo )
  {
    if( rpBuffer->Size() != 0 )
    {
      std::memcpy( pTarget, rpBuffer->Data(), rpBuffer->Size() );
      pTarget += rpBuffer->Size();
    }
  }
  io_rJob.Replace( std::move( pWhole ) );
  return true;
}

bool VVideoFrameEncoder::ConvertPixels( VJob& io_rJob ) const
{
  bool bConverted = false;
  if( m_pConverter )
  {
    std::shared_ptr<KVZ::IBuffer> pTarget = io_rJob.m_rAllocator.Allocate( CoreVideoUtils::GetFrameSize( io_rJob.m_Target ) );
    const KVZ::IBufferConst& rSource = *io_rJob.m_rVideo.front();
    bConverted = pTarget &&
      m_pConverter->Convert( io_rJob.m_rSource, rSource.Data(), rSource.Size(), io_rJob.m_Target.m_PixelFormat, pTarget->Data(), pTarget->Size() );
    if( bConverted )
    {
      io_rJob.Replace( std::move( pTarget ) );
    }
  }
  if( !bConverted )
  {
    KVZ_LOG_ERROR( "VideoEncoding", "Error converting pixel format from '%s' to '%s'.", KVZ::NameOrUnspecified( io_rJob.m_rSource.m_PixelFormat ),
      KVZ::NameOrUnspecified( io_rJob.m_Target.m_PixelFormat ) );
  }
  return bConverted;
}

bool VVideoFrameEncoder::DrawText( VJob& io_rJob ) const
{
  if( !m_pConverter || !m_Parts.m_DrawText )
  {
    KVZ_LOG_ERROR( "VideoEncoding", "Burn-in text is not available." );
    return false;
  }
  if( !io_rJob.m_pOwn )
  {
    const KVZ::IBufferConst& rSource = *io_rJob.m_rVideo.front();
    std::shared_ptr<KVZ::IBuffer> pCopy = io_rJob.m_rAllocator.Allocate( CoreVideoUtils::GetFrameSize( io_rJob.m_Target ) );
    if( !pCopy )
    {
      return false;
    }
    if( rSource.Size() < pCopy->Size() )
    {
      KVZ_LOG_ERROR( "VideoEncoding", "Frame of %1% bytes is too short for its description, which needs %2%.", rSource.Size(), pCopy->Size() );
      return false;
    }
    if( pCopy->Size() != 0 )
    {
      std::memcpy( pCopy->Data(), rSource.Data(), pCopy->Size() );
    }
    io_rJob.Replace( std::move( pCopy ) );
  }
  if( !m_Parts.m_DrawText( *m_pConverter, io_rJob.m_Target, m_BurnIn, io_rJob.m_pOwn->Data(), io_rJob.m_pOwn->Size() ) )
  {
    KVZ_LOG_ERROR( "VideoEncoding", "Error burning text into an image in '%s' pixel format.",
      KVZ::NameOrUnspecified( io_rJob.m_Target.m_PixelFormat ) );
    return false;
  }
  return true;
}

bool VVideoFrameEncoder::Compress( VJob& io_rJob ) const
{
  const auto Compressor = m_Parts.m_Compressors.find( io_rJob.m_Payload );
  if( Compressor == m_Parts.m_Compressors.end() )
  {
    ReportUnsupported( io_rJob.m_Payload );
    return false;
  }
  const KVZ::IBufferConst& rSource = *io_rJob.m_rVideo.front();
  auto pOutput = std::make_shared<VCompressedBuffer>();
  UtilsMemory::VByteVector Scratch;
  if( !Compressor->second( { io_rJob.m_Target, rSource.Data(), rSource.Size(), m_JPEGQuality }, pOutput->Bytes(), Scratch ) )
  {
    KVZ_LOG_ERROR( "VideoEncoding", "Error encoding data in '%s' pixel format to '%s'.", KVZ::NameOrUnspecified( io_rJob.m_Target.m_PixelFormat ),
      KVZ::NameOrUnspecified( io_rJob.m_Payload ) );
    return false;
  }
  io_rJob.Replace( std::move( pOutput ) );
  return true;
}

}
