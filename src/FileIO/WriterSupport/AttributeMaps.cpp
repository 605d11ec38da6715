#include "FileIO/WriterSupport/AttributeMaps.h"

namespace WriterSupport
{

bool EncodeInternalAttributes( const KVZ::VideoFrameInfo& i_rVideo, const KVZ::AudioFrameInfo& i_rAudio, KVZ::IVideoAttributes& o_rAttributes )
{
  return i_rVideo.WriteAttributes( o_rAttributes ) && i_rAudio.WriteAttributes( o_rAttributes );
}

bool EncodeExternalAttributes( const VRecordingDescription& i_rRecording, KVZ::IVideoAttributes& o_rAttributes )
{
  o_rAttributes = i_rRecording.m_rAttributes;
  if( i_rRecording.m_TimingKeys == ETimingKeys::Always || i_rRecording.m_rTiming != KVZ::VTimingRecord() )
  {
    if( !i_rRecording.m_rTiming.WriteAttributes( o_rAttributes ) || !i_rRecording.m_rColour.WriteAttributes( o_rAttributes ) )
    {
      return false;
    }
  }
  const bool bTimecode = i_rRecording.m_TimecodeKeys == ETimecodeKeys::Always || IsValid( i_rRecording.m_rTimecode );
  return !bTimecode || WriteAttributes( i_rRecording.m_rTimecode, o_rAttributes );
}

bool EncodeAttributes( const KVZ::VideoFrameInfo& i_rVideo, const KVZ::AudioFrameInfo& i_rAudio, const VRecordingDescription& i_rRecording,
  const KVZ::VLogCategory& i_rCategory, VAttributeMaps& o_rMaps )
{
  o_rMaps = {};
  if( !EncodeInternalAttributes( i_rVideo, i_rAudio, o_rMaps.m_Internal ) )
  {
    KVZ_LOG_ERROR( i_rCategory, "Could not encode internal attributes." );
    return false;
  }
  if( !EncodeExternalAttributes( i_rRecording, o_rMaps.m_External ) )
  {
    KVZ_LOG_ERROR( i_rCategory, "Could not encode external attributes." );
    return false;
  }
  return true;
}

}
