// The pictures and sounds of a signal: a test pattern, or a clip.
#pragma once

#include "cards/common/CapturedFrame.h"
#include "cards/common/CardSpec.h"

#include <memory>
#include <string>

namespace VirtualCards
{

// Any thread may call; calls of one card never overlap for long.
class ISignalContent
{
public:
  virtual ~ISignalContent() = default;

  // Makes ready for pictures of this kind, which may take as long as a program needs to open its input. A change of the kind begins a
  // clip again. False if there will be no pictures.
  virtual bool Prepare( const VPictureFormat& i_rFormat ) = 0;

  // What belongs to this frame of the signal goes into the captured frame, whose Begin it calls. False: the source has ended, or has
  // nothing to show.
  virtual bool Take( const VSignalFrame& i_rSignal, const VPictureFormat& i_rFormat, VCapturedFrame& o_rFrame ) = 0;

  // Whoever waits inside comes back; there is nothing more.
  virtual void Close() = 0;
};

struct VSignalSource
{
  std::shared_ptr<ISignalContent> m_pContent;
  KVZ::IVideoStandard::Enum m_Standard = DefaultStandard;
};

// Opens what the text of a card asks for. An empty pointer, with one line that begins with the key, if that is not possible.
// i_bWait: a frame waits for the clip's picture whatever the time, as a card stepped by hand must.
VSignalSource OpenSource( const VCardSpec& i_rSpec, bool i_bWait, std::string& o_rError );

// The sound of a frame that carries none of its own: silence of the right length.
void SetSilence( const VSignalFrame& i_rSignal, VSound& o_rSound );

}
