// Tags: the attributes of a recording as names and texts.
#pragma once

#include "Core/VideoInterface/VideoAttributes.h"

#include <matroska/KaxTags.h>

#include <string>
#include <utility>
#include <vector>

namespace MkvIO
{

struct VTagGroup
{
  uint64_t m_TrackUID = 0;   // 0: all tracks
  uint64_t m_ChapterUID = 0;
  std::vector<std::pair<std::string, std::string>> m_Tags;   // name and text
};

// One tag for each attribute, its name put behind the prefix.
void AddAttributes( VTagGroup& io_rGroup, const std::string& i_rPrefix, const KVZ::IVideoAttributes& i_rAttributes );

void FillTags( libmatroska::KaxTags& o_rTags, const std::vector<VTagGroup>& i_rGroups );

}
