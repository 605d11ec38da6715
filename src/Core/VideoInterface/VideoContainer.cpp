#include "Core/VideoInterface/VideoContainer.h"

#include "Core/VideoInterface/Schemas.h"

#include <array>

namespace KVZ
{

namespace
{

constexpr std::array Rows = {
  VEnumRow{ IVideoContainer::EMOV, "MOV", "Apple QuickTime container format (*.mov, *.moov)" },
  VEnumRow{ IVideoContainer::EMP4, "MP4", "MPEG4 container based on Apple QuickTime (*.mp4)" },
  VEnumRow{ IVideoContainer::EAVI, "AVI", "Container developed by Microsoft and used for VideoForWindows/DirectShow (*.avi)" },
  VEnumRow{ IVideoContainer::ETVID, "TVID", "Tarvo video container (*.tvid)" },
  VEnumRow{ IVideoContainer::EMKV, "MKV", "Matroska container (*.mkv, *.mka)" },
  VEnumRow{ IVideoContainer::EIMAGES, "IMAGES", "Sequence of image files" },
};
static_assert( Rows.size() == VideoContainerCount );

constexpr VEnumTable Table{ "VideoContainer.Enum", "Enumeration of container formats.", Rows };

}

const VEnumTable& GetEnumTable( IVideoContainer::Enum ) { return Table; }

const char* GetFileExtension( IVideoContainer::Enum i_Container )
{
  constexpr std::array<const char*, VideoContainerCount> Extensions = { "mov", "mp4", "avi", "tvid", "mkv", "" };
  const bool bKnown = i_Container >= 0 && i_Container < VideoContainerCount;
  return bKnown ? Extensions[i_Container] : "";
}

std::string ToName( IVideoContainer::Enum i_Value ) { return FindName( Table, i_Value ); }

bool FromName( const std::string& i_rName, IVideoContainer::Enum& o_rValue ) { return FindEnumerator( Table, i_rName, o_rValue ); }

}
