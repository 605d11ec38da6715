// Draws test pictures. A painter fills a picture's memory once and from then on only touches what moves, so that a card costs little.
#pragma once

#include "cards/common/CardSpec.h"
#include "cards/common/Picture.h"
#include "cards/common/SignalTimeline.h"

#include <memory>

namespace VirtualCards
{

// One painter for each format and pattern. Any thread may paint; one picture only one thread at a time.
class IPainter
{
public:
  IPainter();
  virtual ~IPainter() = default;
  // Makes the picture that of this frame, whatever it was before.
  virtual void Paint( VPicture& io_rPicture, const VSignalFrame& i_rFrame ) const = 0;

protected:
  const uint64_t m_Id;   // never 0, never used twice
};

// The pixel format must be one that can be drawn.
std::unique_ptr<IPainter> MakePainter( EPattern i_Pattern, const VPictureFormat& i_rFormat );

// 75 % colour bars, a grey ramp, and below them in a black band the timecode and the frame number; a white bar moves across.
std::unique_ptr<IPainter> MakeBarsPainter( const VPictureFormat& i_rFormat );

// 32 cells of 16 by 16 pixels from the top left corner hold the frame number, highest bit first, white for 1; the next row of cells
// its complement. The rest is a fixed gradient. Shows loss, repetition and reordering to any reader.
std::unique_ptr<IPainter> MakeCounterPainter( const VPictureFormat& i_rFormat );

// Noise that follows from the frame number alone: what compresses worst.
std::unique_ptr<IPainter> MakeNoisePainter( const VPictureFormat& i_rFormat );

// What a card delivers without a signal.
std::unique_ptr<IPainter> MakeBlackPainter( const VPictureFormat& i_rFormat );

}
