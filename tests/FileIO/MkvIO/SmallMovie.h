// A recording of a few bytes, written into memory: 4 x 1 grey pixels and two channels of 16-bit sound.
#pragma once

#include "FileIO/MkvIO/MkvWriter.h"
#include "tests/support/SmallRecording.h"

namespace MkvIO
{

// What a header is given besides the writer's own defaults here.
struct VDescription : TestSupport::VHeader
{
  VDescription()
  {
    m_Video = TestSupport::VideoInfo();
    m_Audio = { KVZ::IAudioSampleFormat::EInt16, 48000, 2 };
    m_Timing = TestSupport::Rate2997;
  }
};

struct VSmallMovie : TestSupport::VMemoryRecording<VMkvWriter>
{
  VSmallMovie() : VMemoryRecording( VDescription(), {}, []( WriterSupport::VStreamMaker i_Maker ) { return VMkvWriter( {}, std::move( i_Maker ) ); } )
  {
  }

  bool WriteFrame( const std::string& i_rVideo, const std::string& i_rAudio, uint64_t i_Key = TestSupport::AppendKey )
  {
    return Frame( TestSupport::Bytes( i_rVideo ), TestSupport::Bytes( i_rAudio ), i_Key );
  }
};

}
