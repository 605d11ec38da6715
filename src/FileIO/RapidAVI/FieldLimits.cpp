#include "FileIO/RapidAVI/StreamFormats.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <algorithm>
#include <limits>

namespace RapidAVI
{

namespace
{

struct VFieldCheck
{
  const char* m_pName;
  uint64_t m_Value;
  uint64_t m_Limit;
};

bool IsHeld( const VFieldCheck& i_rCheck )
{
  const bool bHeld = i_rCheck.m_Value <= i_rCheck.m_Limit;
  if( !bHeld )
  {
    KVZ_LOG_ERROR( "RapidAVI", "%1% of %2% cannot be stored: %3% is the limit.", i_rCheck.m_pName, i_rCheck.m_Value, i_rCheck.m_Limit );
  }
  return bHeld;
}

}

bool FitsHeaders( const VFileDescription& i_rFile )
{
  constexpr uint64_t Limit16 = std::numeric_limits<uint16_t>::max();
  constexpr uint64_t Limit32 = std::numeric_limits<uint32_t>::max();
  const KVZ::AudioFrameInfo& rAudio = i_rFile.m_Audio;
  const uint64_t BlockSize = uint64_t{ KVZ::GetBytesPerSample( rAudio.m_SampleFormat ) } * rAudio.m_Channels;
  const std::array Checks = {
    VFieldCheck{ "A width in pixels", i_rFile.m_Video.m_ImageWidth, Limit16 },
    VFieldCheck{ "A height in lines", i_rFile.m_Video.m_ImageHeight, Limit16 },
    VFieldCheck{ "An image size in bytes", GetFrameBytes( i_rFile ), Limit32 },
    VFieldCheck{ "A frame period in microseconds", GetMicrosecondsPerFrame( i_rFile ), Limit32 },
    VFieldCheck{ "A number of audio channels", rAudio.m_Channels, Limit16 },
    VFieldCheck{ "An audio sample frame in bytes", BlockSize, Limit16 },
  };
  return std::all_of( Checks.begin(), Checks.end(), IsHeld ) &&
    IsHeld( { "An audio data rate in bytes a second", BlockSize * rAudio.m_SampleRate, Limit32 } );
}

}
