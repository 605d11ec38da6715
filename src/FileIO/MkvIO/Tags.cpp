#include "FileIO/MkvIO/Tags.h"

#include "FileIO/MkvIO/ElementSetting.h"
#include "FileIO/WriterSupport/AttributeText.h"

#include <matroska/KaxSemantic.h>

namespace MkvIO
{

using namespace libmatroska;

namespace
{

void FillTargets( KaxTagTargets& o_rTargets, const VTagGroup& i_rGroup )
{
  if( i_rGroup.m_TrackUID != 0 )
  {
    Set<KaxTagTrackUID>( o_rTargets, i_rGroup.m_TrackUID );
  }
  if( i_rGroup.m_ChapterUID != 0 )
  {
    Set<KaxTagChapterUID>( o_rTargets, i_rGroup.m_ChapterUID );
  }
  Set<KaxTagAttachmentUID>( o_rTargets, 0u );
}

}

void AddAttributes( VTagGroup& io_rGroup, const std::string& i_rPrefix, const KVZ::IVideoAttributes& i_rAttributes )
{
  for( const auto& rEntry : i_rAttributes.Values() )
  {
    io_rGroup.m_Tags.emplace_back( i_rPrefix + rEntry.first, WriterSupport::GetAttributeText( i_rAttributes, rEntry.first ) );
  }
}

void FillTags( KaxTags& o_rTags, const std::vector<VTagGroup>& i_rGroups )
{
  for( const VTagGroup& rGroup : i_rGroups )
  {
    auto& rTag = libebml::AddNewChild<KaxTag>( o_rTags );
    FillTargets( libebml::GetChild<KaxTagTargets>( rTag ), rGroup );
    for( const auto& [rName, rText] : rGroup.m_Tags )
    {
      auto& rSimple = libebml::AddNewChild<KaxTagSimple>( rTag );
      libebml::GetChild<KaxTagName>( rSimple ).SetValueUTF8( rName );
      libebml::GetChild<KaxTagString>( rSimple ).SetValueUTF8( rText );
    }
  }
}

}
