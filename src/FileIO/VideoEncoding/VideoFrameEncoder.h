// Brings the buffers of one captured frame into the payload that a file stores: joins split buffers, converts the pixel format, draws
// text and compresses. A frame that needs none of this passes through without a copy.
//
// Several threads may encode different frames at once, where the converter's Convert and the compressors allow it. Settings must not change
// meanwhile, and so not during a capture.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"
#include "FileIO/VideoEncoding/EncoderParts.h"

namespace VideoEncoding
{

// The pixel format that a payload stores of a source format. False, with a line in the log and the output left alone, for a payload that
// cannot be encoded.
bool PixelFormatForPayloadFormat( KVZ::IVideoPayload::Enum i_Payload, KVZ::IPixelFormat::Enum i_Source, KVZ::IPixelFormat::Enum& o_rStored );

class VVideoFrameEncoder
{
public:
  explicit VVideoFrameEncoder( EConverter i_Converter = EConverter::Software, const VEncoderParts& i_rParts = DefaultEncoderParts() );

  void SetJPEGQuality( int i_Quality ) { m_JPEGQuality = i_Quality; }
  void SetBurnIn( const VBurnInSettings& i_rSettings ) { m_BurnIn = i_rSettings; }
  // These three go to the converter at once.
  void SetColour( const KVZ::VColourRecord& i_rColour );
  // Corrects the lens while it converts, which makes a conversion of frames that are in their target format already.
  void SetLensCorrection( const KVZ::VLensDistortionRecord& i_rLens );
  void SetLensCorrectionEnabled( bool i_bEnabled );

  // Digits of a frame's number in file names.
  uint32_t GetFrameNumberDigits() const { return 8; }

  // The list is replaced by the result. i_PixelFormat is what an uncompressed payload shall be; other payloads have their own. False, with
  // a line in the log, if the frame cannot be encoded.
  bool Encode( KVZ::IBufferAllocator& i_rAllocator, KVZ::VBufferList& io_rVideo, const KVZ::VideoFrameInfo& i_rInfo,
    KVZ::IVideoPayload::Enum i_Payload, KVZ::IPixelFormat::Enum i_PixelFormat ) const;

private:
  struct VJob;

  bool Join( VJob& io_rJob ) const;
  bool ConvertPixels( VJob& io_rJob ) const;
  bool DrawText( VJob& io_rJob ) const;
  bool Compress( VJob& io_rJob ) const;

  const VEncoderParts m_Parts;
  const std::shared_ptr<KVZ::IPixelFormatConverter> m_pConverter;   // empty where none is registered
  int m_JPEGQuality = 90;
  VBurnInSettings m_BurnIn;
  bool m_bForceConversion = false;
};

}
