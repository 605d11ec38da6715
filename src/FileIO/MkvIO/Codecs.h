// How payloads are named in a Matroska file.
#pragma once

#include "Core/VideoInterface/FrameRecords.h"

#include <boost/optional.hpp>

namespace MkvIO
{

// Where the four characters of an uncompressed pixel format are kept.
enum class EFourCCPlace
{
  None,
  BitmapHeader,   // the codec's private data
  ColourSpace
};

struct VVideoCodec
{
  const char* m_pId;
  EFourCCPlace m_Place = EFourCCPlace::None;
  const char* m_pFourCC = "UDEF";
};

struct VAudioCodec
{
  const char* m_pId;
  uint64_t m_BitDepth;
};

// Empty, with a line in the log, for what cannot be stored.
boost::optional<VVideoCodec> FindVideoCodec( KVZ::IVideoPayload::Enum i_Payload, KVZ::IPixelFormat::Enum i_Format );
boost::optional<VAudioCodec> FindAudioCodec( KVZ::IAudioSampleFormat::Enum i_Format );

}
