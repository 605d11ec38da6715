// A recording of a few bytes, written into memory: 4 x 1 pixels of 4:2:2, one channel of 16-bit sound, 25 frames a second.
#pragma once

#include "FileIO/RapidAVI/Writer.h"
#include "tests/support/RiffParser.h"
#include "tests/support/SmallRecording.h"

namespace RapidAVI
{

struct VSettings : TestSupport::VHeader
{
  explicit VSettings( const KVZ::VideoFrameInfo& i_rVideo = TestSupport::VideoInfo( KVZ::IPixelFormat::EU8Y8V8Y8 ) ) { m_Video = i_rVideo; }
};

struct VAviFile : TestSupport::VMemoryRecording<VRapidAVIWriter>
{
  explicit VAviFile( const TestSupport::VHeader& i_rSettings = VSettings(), const VSegmentLimits& i_rLimits = {},
    std::shared_ptr<VideoEncoding::VVideoFrameEncoder> i_pEncoder = {} )
    : VMemoryRecording( i_rSettings, {},
        [&]( WriterSupport::VStreamMaker i_Maker ) { return VRapidAVIWriter( std::move( i_pEncoder ), std::move( i_Maker ), i_rLimits ); } )
  {
  }

  TestSupport::VAviParser Parse() const { return TestSupport::VAviParser( *m_pBytes ); }
};

}
