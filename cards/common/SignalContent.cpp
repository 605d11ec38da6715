#include "cards/common/SignalContent.h"

#include "StageCoreRuntime/ThreadAnnotations.h"
#include "cards/common/ClipReader.h"

#include <boost/thread/lock_guard.hpp>
#include <boost/thread/mutex.hpp>

namespace VirtualCards
{

namespace
{

void SetMadeSound( const VSignalFrame& i_rSignal, EAudio i_Audio, uint32_t i_Channels, VSound& o_rSound )
{
  o_rSound.m_Audio = i_Audio;
  o_rSound.m_bClip = false;
  o_rSound.m_SignalChannels = i_Channels;
  o_rSound.m_FirstSample = i_rSignal.m_FirstSample;
  o_rSound.m_Samples = i_rSignal.m_Samples;
}

class VPatternContent final : public ISignalContent
{
public:
  explicit VPatternContent( const VCardSpec& i_rSpec )
    : m_Pattern( i_rSpec.m_Pattern ), m_Audio( i_rSpec.m_Audio.value_or( EAudio::Tone ) ), m_Channels( i_rSpec.m_Channels )
  {
  }

  bool Prepare( const VPictureFormat& i_rFormat ) override
  {
    Painter( i_rFormat );
    return true;
  }

  bool Take( const VSignalFrame& i_rSignal, const VPictureFormat& i_rFormat, VCapturedFrame& o_rFrame ) override
  {
    o_rFrame.Begin( i_rSignal, i_rFormat, Painter( i_rFormat ) );
    SetMadeSound( i_rSignal, m_Audio, m_Channels, o_rFrame.Sound() );
    return true;
  }

  void Close() override {}

private:
  std::shared_ptr<const IPainter> Painter( const VPictureFormat& i_rFormat )
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( !m_pPainter || m_Format != i_rFormat )
    {
      m_pPainter = MakePainter( m_Pattern, i_rFormat );
      m_Format = i_rFormat;
    }
    return m_pPainter;
  }

  const EPattern m_Pattern;
  const EAudio m_Audio;
  const uint32_t m_Channels;

  boost::mutex m_Mutex;
  VPictureFormat m_Format GUARDED_BY( m_Mutex );
  std::shared_ptr<const IPainter> m_pPainter GUARDED_BY( m_Mutex );
};

class VClipContent final : public ISignalContent
{
public:
  VClipContent( const VCardSpec& i_rSpec, VClipInput i_Input, bool i_bWait )
    : m_Input( std::move( i_Input ) ),
      m_Audio( i_rSpec.m_Audio ),
      m_Channels( i_rSpec.m_Channels ),
      m_bLoop( i_rSpec.m_bLoop ),
      m_bWait( i_bWait || !m_Input.m_bOptionsForm )
  {
  }

  bool Prepare( const VPictureFormat& i_rFormat ) override
  {
    const std::shared_ptr<VClipReader> pReader = Reader( i_rFormat );
    return pReader && ( pReader->HasEnded() || pReader->WaitForPicture() );
  }

  bool Take( const VSignalFrame& i_rSignal, const VPictureFormat& i_rFormat, VCapturedFrame& o_rFrame ) override
  {
    const std::shared_ptr<VClipReader> pReader = Reader( i_rFormat );
    VSound& rSound = o_rFrame.Sound();
    if( !pReader || !pReader->Take( i_rSignal.m_Samples, o_rFrame.Picture(), rSound.m_Clip ) )
    {
      return false;
    }
    o_rFrame.Begin( i_rSignal, i_rFormat, nullptr );
    SetMadeSound( i_rSignal, m_Audio.value_or( EAudio::Silence ), m_Channels, rSound );
    rSound.m_bClip = !m_Audio && m_Input.m_AudioChannels > 0;
    rSound.m_ClipChannels = m_Input.m_AudioChannels;
    return true;
  }

  void Close() override
  {
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    m_bClosed = true;
    if( m_pReader )
    {
      m_pReader->Close();
    }
  }

private:
  std::shared_ptr<VClipReader> Reader( const VPictureFormat& i_rFormat )
  {
    std::shared_ptr<VClipReader> pFormer;   // ends outside the lock
    const boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_bClosed )
    {
      return nullptr;
    }
    if( !m_pReader || m_pReader->Format() != i_rFormat )
    {
      pFormer = std::move( m_pReader );
      m_pReader = std::make_shared<VClipReader>( m_Input, i_rFormat, m_bLoop, m_bWait );
    }
    return m_pReader;
  }

  const VClipInput m_Input;
  const std::optional<EAudio> m_Audio;
  const uint32_t m_Channels;
  const bool m_bLoop;
  const bool m_bWait;

  boost::mutex m_Mutex;
  bool m_bClosed GUARDED_BY( m_Mutex ) = false;
  std::shared_ptr<VClipReader> m_pReader GUARDED_BY( m_Mutex );
};

VSignalSource OpenClip( const VCardSpec& i_rSpec, bool i_bWait, std::string& o_rError )
{
  std::string Reason;
  std::optional<VClipInput> Input = ProbeClip( i_rSpec.m_Input, Reason );
  if( !Input )
  {
    o_rError = "input: " + Reason;
    return {};
  }
  const KVZ::IVideoStandard::Enum Standard = i_rSpec.m_Standard ? *i_rSpec.m_Standard : NearestStandard( *i_rSpec.m_pKind, *Input );
  Reason = i_rSpec.m_Timecode ? WhyNotAt( *i_rSpec.m_Timecode, KVZ::GetFramePeriod( Standard ) ) : std::string();
  if( !Reason.empty() )
  {
    o_rError = "timecode: " + Reason + " (the input is shown as " + KVZ::ToName( Standard ) + ")";
    return {};
  }
  return { std::make_shared<VClipContent>( i_rSpec, std::move( *Input ), i_bWait ), Standard };
}

}

VSignalSource OpenSource( const VCardSpec& i_rSpec, bool i_bWait, std::string& o_rError )
{
  if( !i_rSpec.m_Input.empty() )
  {
    return OpenClip( i_rSpec, i_bWait, o_rError );
  }
  return { std::make_shared<VPatternContent>( i_rSpec ), i_rSpec.m_Standard.value_or( DefaultStandard ) };
}

void SetSilence( const VSignalFrame& i_rSignal, VSound& o_rSound ) { SetMadeSound( i_rSignal, EAudio::Silence, 0, o_rSound ); }

}
