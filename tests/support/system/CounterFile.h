// A recording of a card with pattern=counter and audio=ramp, read frame by frame from the file.
#pragma once

#include "tests/support/system/StageHost.h"

#include <cstdint>
#include <string>
#include <vector>

namespace SystemTests
{

struct VCounterFrame
{
  uint32_t m_Counter = 0;       // the card's running frame number
  uint16_t m_FirstSample = 0;   // of the card's running sample number, modulo 65536
  uint32_t m_Samples = 0;       // per channel
};

// The rate of a card's signal, and what it means for timecode and sound.
struct VSignalRate
{
  const char* m_pStandard = nullptr;
  int64_t m_Period = 0;           // ticks of 1/135000000 s
  uint32_t m_NominalFrames = 0;   // what the frames field of the timecode counts to
  uint32_t m_FramesPerLabel = 1;
  bool m_bDropFrame = false;
  std::vector<uint32_t> m_SampleCadence;   // samples of the frames 0, 1, ... of the card, over and over
  const char* m_pKind = "decklink";        // of the card
  uint32_t m_SamplesLeftOut = 0;           // at the end of a frame, at most
};

// A card with this signal that counts in picture and sound, and more keys behind a comma each.
std::string CounterCardText( const VSignalRate& i_rRate, const std::string& i_rMore = {} );
// The same as arguments, with the pixel format that is read here: by itself a Bluefish444 card delivers luma alone.
VArguments CounterCard( const VSignalRate& i_rRate, const std::string& i_rMore = {} );

// All frames of the file in the order of their keys, in U8Y8V8Y8 with Int16 sound or none. Reports, as a failed check, a picture that is not whole:
// an unreadable counter, a background that differs from the first frame's, a ramp that is not one, keys that do not count from 0.
std::vector<VCounterFrame> ReadCounterFile( const std::string& i_rPath );

// The numbers in the pictures of any movie or sequence of images ("frame_%08d.png"), as FFmpeg decodes them; 0xFFFFFFFF in one without. FFmpeg may
// complain of a last one that was cut short.
std::vector<uint32_t> DecodeCounters( const std::string& i_rPath, uint32_t i_Width, uint32_t i_Height );

// The same where nothing is missing: ExpectUnbroken holds for them.
std::vector<VCounterFrame> ReadUnbroken( const std::string& i_rPath, const VSignalRate& i_rRate );

// Counters without a gap, sound without a break at the joints of frames, and as many samples in each frame as the cadence has there.
void ExpectUnbroken( const std::vector<VCounterFrame>& i_rFrames, const VSignalRate& i_rRate );

// The label of a card's frame, counted label by label from that of frame 0: "HH:MM:SS:FF", or "HH:MM:SS;FF" in drop-frame.
std::string LabelOfFrame( const std::string& i_rStartLabel, const VSignalRate& i_rRate, uint32_t i_Frame );

// Ticks from midnight to the beginning of a card's frame, by the labels that have passed.
int64_t TickOfFrame( const std::string& i_rStartLabel, const VSignalRate& i_rRate, uint32_t i_Frame );

}
