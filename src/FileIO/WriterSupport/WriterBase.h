// What every writer does the same way: the "open" checks, the five checks of a header, the frame-set form of WriteFrame, and the promise
// that no exception leaves it. A container derives from this and stores; what it is given has passed the checks.
#pragma once

#include "Core/VideoInterface/VideoWriter.h"
#include "StageCoreRuntime/GlobalLog.h"

#include <exception>

namespace WriterSupport
{

struct VHeader
{
  const KVZ::VideoFrameInfo& m_rVideo;
  const KVZ::AudioFrameInfo& m_rAudio;
  const KVZ::VTimingRecord& m_rTiming;
  const KVZ::ITimecode& m_rTimecode;
  const KVZ::VColourRecord& m_rColour;
  const KVZ::IVideoAttributes& m_rAttributes;
  KVZ::IVideoPayload::Enum m_VideoPayload;
  KVZ::IAudioPayload::Enum m_AudioPayload;
};

struct VFrame
{
  KVZ::VBufferList& m_rVideo;
  const KVZ::VideoFrameInfo& m_rVideoInfo;
  KVZ::VBufferList& m_rAudio;
  const KVZ::AudioFrameInfo& m_rAudioInfo;
  uint64_t m_Key;
};

class VWriterBase : public KVZ::IVideoWriter
{
public:
  bool Open( const std::string& i_rPath ) final;
  bool WriteHeader( const KVZ::VideoFrameInfo& i_rVideoInfo, const KVZ::AudioFrameInfo& i_rAudioInfo, const KVZ::VTimingRecord& i_rTiming,
    const KVZ::ITimecode& i_rTimecode, const KVZ::VColourRecord& i_rColour, const KVZ::IVideoAttributes& i_rAttributes,
    KVZ::IVideoPayload::Enum i_VideoPayload, KVZ::IAudioPayload::Enum i_AudioPayload ) final;
  bool WriteFrame( const KVZ::VFrameSet& i_rFrameSet, uint64_t i_FrameKey ) final;
  bool WriteFrame( KVZ::VBufferList& io_rVideo, const KVZ::VideoFrameInfo& i_rVideoInfo, KVZ::VBufferList& io_rAudio,
    const KVZ::AudioFrameInfo& i_rAudioInfo, uint64_t i_FrameKey ) final;
  bool Close() final;

protected:
  // The category is named after the container's namespace.
  explicit VWriterBase( const char* i_pCategory ) : m_rCategory( KVZ::LogCategory( i_pCategory ) ) {}

  const KVZ::VLogCategory& Category() const { return m_rCategory; }
  bool IsHeaded() const { return m_State == EState::Headed; }

  // Runs a further operation of a container under the same promise: an exception becomes a line in the log and false.
  template<class TOperation>
  bool Guarded( const char* i_pName, TOperation i_Operation ) const
  {
    try
    {
      return i_Operation();
    }
    catch( const std::exception& rError )
    {
      KVZ_LOG_ERROR( m_rCategory, "%1% failed: %2%", i_pName, rError.what() );
      return false;
    }
  }

private:
  enum class EState
  {
    New,
    Opened,
    HeaderFailed,
    Headed
  };

  virtual bool DoOpen( const std::string& i_rPath ) = 0;
  virtual bool DoWriteHeader( const VHeader& i_rHeader ) = 0;
  virtual bool DoWriteFrame( VFrame& io_rFrame ) = 0;
  // Leaves the writer closed, whatever the result. False also for a file that failed before.
  virtual bool DoClose() = 0;

  bool CheckHeader( const VHeader& i_rHeader ) const;

  const KVZ::VLogCategory& m_rCategory;
  EState m_State = EState::New;
};

}
