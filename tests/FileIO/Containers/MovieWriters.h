// The containers, one row each, and the recordings that their common tests write.
#pragma once

#include "tests/support/SmallRecording.h"

namespace Containers
{

struct VContainerRow
{
  const char* m_pName;   // the extension
  KVZ::IVideoContainer::Enum m_Container;
};

constexpr VContainerRow Mov = { "mov", KVZ::IVideoContainer::EMOV };
constexpr VContainerRow MP4 = { "mp4", KVZ::IVideoContainer::EMP4 };
constexpr VContainerRow Avi = { "avi", KVZ::IVideoContainer::EAVI };
constexpr VContainerRow Mkv = { "mkv", KVZ::IVideoContainer::EMKV };
constexpr VContainerRow Tvid = { "tvid", KVZ::IVideoContainer::ETVID };
constexpr VContainerRow Images = { "%FRAME%", KVZ::IVideoContainer::EIMAGES };

// Parameters of tests are named by their containers.
inline void PrintTo( const VContainerRow& i_rRow, std::ostream* o_pText ) { *o_pText << i_rRow.m_pName; }

struct VWriterParts
{
  WriterSupport::VStreamMaker m_StreamMaker = WriterSupport::MakeFile;
  bool m_bCompressors = false;   // of JPEG, PNG and TIFF
  uint64_t m_RiffBytes = 0;      // where an AVI begins its next RIFF; 0 for the usual places
};

std::shared_ptr<KVZ::IVideoWriter> MakeWriter( KVZ::IVideoContainer::Enum i_Container, VWriterParts i_Parts = {} );

// 4:2:2 with one channel of 16-bit sound, 25 frames a second and their timecode.
TestSupport::VHeader MovieHeader( uint32_t i_Width, uint32_t i_Height );

}
