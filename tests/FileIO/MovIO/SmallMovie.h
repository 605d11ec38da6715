// A movie of a few bytes, written into memory: 4 x 2 pixels of 4:2:2, one channel of 16-bit sound, 25 frames a second.
#pragma once

#include "FileIO/MovIO/MovWriter.h"
#include "tests/support/MovParser.h"
#include "tests/support/SmallRecording.h"

namespace MovIO
{

// What goes into the header of a writer.
struct VMovieSettings : TestSupport::VHeader
{
  VMovieSettings() { m_Timecode = { KVZ::ITimecodeStandard::ETimecode25, 1 }; }

  static VMovieSettings Silent()
  {
    VMovieSettings Settings;
    Settings.m_Audio = {};
    return Settings;
  }

  KVZ::IVideoContainer::Enum m_Container = KVZ::IVideoContainer::EMOV;
};

struct VSmallMovie : TestSupport::VMemoryRecording<VMovWriter>
{
  explicit VSmallMovie( const VMovieSettings& i_rSettings = {}, const TestSupport::VFault& i_rFault = {} )
    : VMemoryRecording( i_rSettings, i_rFault,
        [&]( WriterSupport::VStreamMaker i_Maker ) { return VMovWriter( i_rSettings.m_Container, {}, std::move( i_Maker ) ); } )
  {
  }

  TestSupport::VMovParser Parse() const { return TestSupport::VMovParser::OfBytes( *m_pBytes ); }
};

inline const TestSupport::VMovAtom& SampleTable( const TestSupport::VMovParser& i_rParser, size_t i_Track )
{
  return i_rParser.Root().Child( "moov" ).Child( "trak", i_Track ).Child( "mdia" ).Child( "minf" ).Child( "stbl" );
}

}
