// What happens to a frame before a file's writer gets it, where the capture's target asks for that: its pixel format is changed, its lens undone,
// and its timecode drawn into a copy of it. The settings of a writer's own encoder stay the same for a whole capture; a text does not.
#pragma once

#include "Core/VideoInterface/BufferAllocator.h"
#include "HardwareSupport/VideoInput/VideoInputDataSource/VideoInputDataSource.h"
#include "StageCorePluginInterface/StageCoreHost.h"
#include "StageCoreRuntime/ThreadAnnotations.h"

#include <boost/thread/mutex.hpp>

#include <memory>
#include <string>
#include <vector>

namespace VideoEncoding
{
class VVideoFrameEncoder;
}

namespace VideoInputHAL
{

// Any thread, several at once.
class VFrameConversion
{
public:
  VFrameConversion( const StageCorePluginInterface::VCaptureTarget& i_rTarget, const VVideoEncoderSettings& i_rSettings );
  ~VFrameConversion();

  // The format in which a writer gets frames of this format: the format that the file stores, where there is anything to do.
  KVZ::IPixelFormat::Enum FormatFor( KVZ::IPixelFormat::Enum i_Captured ) const;

  // Replaces the list where there is anything to do, and sets the description's pixel format. False, with a line in the log, if it cannot be done.
  bool Apply( const KVZ::ITimecode& i_rTimecode, KVZ::VBufferList& io_rVideo, KVZ::VideoFrameInfo& io_rInfo );

private:
  using VEncoder = VideoEncoding::VVideoFrameEncoder;

  std::unique_ptr<VEncoder> MakeEncoder() const;
  std::unique_ptr<VEncoder> TakeEncoder();
  void GiveBack( std::unique_ptr<VEncoder> i_pEncoder );

  const KVZ::IVideoPayload::Enum m_Payload;
  const KVZ::IPixelFormat::Enum m_WantedFormat;   // of an uncompressed payload; "Unspecified" keeps what was captured
  const bool m_bTimecode;
  const bool m_bLens;
  const KVZ::VLensDistortionRecord m_Lens;
  const VideoEncoding::EConverter m_Converter;
  const std::shared_ptr<KVZ::IBufferAllocator> m_pAllocator;
  boost::mutex m_Mutex;
  std::vector<std::unique_ptr<VEncoder>> m_FreeEncoders GUARDED_BY( m_Mutex );   // one for each thread that was here at once
};

// The capture's wish, or else the module's.
VideoEncoding::EConverter ConverterFor( const StageCorePluginInterface::VCaptureTarget& i_rTarget, const VVideoEncoderSettings& i_rSettings );

// "01:02:03:04", with a full stop and the number of the frame within the label where several share one: "01:02:03:04.1". Dashes for the digits
// of a timecode that is not valid.
std::string BurnInTextOf( const KVZ::ITimecode& i_rTimecode );

// At the upper edge, in the middle, one line below it; as large as a fifteenth of the picture's height allows.
VideoEncoding::VBurnInSettings BurnInPlaceFor( const std::string& i_rText, const KVZ::VideoFrameInfo& i_rInfo );

}
