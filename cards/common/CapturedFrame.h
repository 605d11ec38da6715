// One frame as a card holds it for its client: what the signal carried then, with pixels and samples that are made when first asked for.
//
// So a client that looks at the flags alone, as drivers do while nothing is captured, costs next to nothing.
#pragma once

#include "cards/common/Painter.h"
#include "cards/common/Sound.h"

#include <boost/thread/mutex.hpp>

#include <memory>
#include <vector>

namespace VirtualCards
{

class VCapturedFrame
{
public:
  // Card's thread, while no client has the frame. The sound's memory is reused.
  VPicture& Picture() { return m_Picture; }
  VSound& Sound() { return m_Sound; }
  // A null painter: the picture's bytes are there already.
  void Begin( const VSignalFrame& i_rSignal, const VPictureFormat& i_rFormat, std::shared_ptr<const IPainter> i_pPainter );

  const VSignalFrame& Signal() const { return m_Signal; }
  const VPictureFormat& Format() const { return m_Format; }
  const VSound& Sound() const { return m_Sound; }

  // Any thread. Valid until the frame is begun again.
  uint8_t* PictureBytes();
  // All calls for one frame must ask for the same layout.
  uint8_t* SoundBytes( const VSoundLayout& i_rLayout );

private:
  VSignalFrame m_Signal;
  VPictureFormat m_Format;
  VSound m_Sound;
  std::shared_ptr<const IPainter> m_pPainter;

  boost::mutex m_Mutex;   // first looks of several threads
  bool m_bPainted = false;
  bool m_bWritten = false;
  VPicture m_Picture;
  std::vector<uint8_t> m_SoundBytes;
};

}
