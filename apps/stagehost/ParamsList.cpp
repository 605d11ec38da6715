#include "apps/stagehost/ParamsList.h"

#include "apps/stagehost/TextTable.h"

#include <nlohmann/json.hpp>

#include <algorithm>
#include <sstream>
#include <utility>

using StageHost::VSettingInfo;

namespace
{

// Characters in a cell; --json has it all.
constexpr size_t LongestValue = 40;
constexpr size_t LongestChoices = 80;

bool IsSaved( const VSettingInfo& i_rSetting, const std::vector<VDataPath>& i_rSaved )
{
  return std::count( i_rSaved.begin(), i_rSaved.end(), VDataPath::FromString( i_rSetting.m_Path ) ) > 0;
}

// What a person may choose from, in as many lines as that takes; an empty one where there is no choice.
std::vector<std::string> AcceptedTexts( const VSettingInfo& i_rSetting )
{
  if( i_rSetting.m_bReadOnly )
  {
    return { "" };
  }
  if( i_rSetting.m_Allowed.empty() )
  {
    const bool bRange = !i_rSetting.m_Minimum.empty() || !i_rSetting.m_Maximum.empty();
    return { bRange ? i_rSetting.m_Minimum + " to " + i_rSetting.m_Maximum : i_rSetting.m_Type };
  }
  std::vector<std::string> Lines;
  for( const std::string& rChoice : i_rSetting.m_Allowed )
  {
    const bool bFits = !Lines.empty() && Lines.back().size() + rChoice.size() + 2 <= LongestChoices;
    if( !Lines.empty() )
    {
      Lines.back() += bFits ? ", " : ",";
    }
    if( !bFits )
    {
      Lines.emplace_back();
    }
    Lines.back() += OneLine( rChoice );
  }
  return Lines;
}

std::string ValueText( const std::string& i_rValue ) { return Shortened( OneLine( i_rValue ), LongestValue ); }

std::vector<std::string> Flags( const VSettingInfo& i_rSetting, const std::vector<VDataPath>& i_rSaved )
{
  std::vector<std::string> Words;
  const auto Add = [&]( bool i_bSet, const char* i_pWord )
  {
    if( i_bSet )
    {
      Words.push_back( i_pWord );
    }
  };
  Add( IsSaved( i_rSetting, i_rSaved ), "saved" );
  Add( i_rSetting.m_bReadOnly, "read-only" );
  Add( i_rSetting.m_bVerifyRequired, "verified" );
  Add( i_rSetting.m_bNotSerialized, "never-saved" );
  Add( i_rSetting.m_bAdvanced, "advanced" );
  Add( i_rSetting.m_bHidden, "hidden" );
  Add( i_rSetting.m_bInTicks, "ticks" );
  return Words;
}

std::string GroupOf( const VSettingInfo& i_rSetting ) { return VDataPath::FromString( i_rSetting.m_Path ).Parent().ToString(); }

// Of groups, in the order in which their first settings come.
std::vector<std::string> Groups( const std::vector<VSettingInfo>& i_rSettings )
{
  std::vector<std::string> Names;
  for( const VSettingInfo& rSetting : i_rSettings )
  {
    const std::string Group = GroupOf( rSetting );
    if( std::find( Names.begin(), Names.end(), Group ) == Names.end() )
    {
      Names.push_back( Group );
    }
  }
  return Names;
}

}

nlohmann::ordered_json ToJson( const VSettingInfo& i_rSetting, const std::vector<VDataPath>& i_rSaved )
{
  return { { "path", i_rSetting.m_Path }, { "value", i_rSetting.m_Value }, { "proposed", i_rSetting.m_Proposed }, { "default", i_rSetting.m_Default },
    { "type", i_rSetting.m_Type }, { "display", i_rSetting.m_Display }, { "description", i_rSetting.m_Description },
    { "category", i_rSetting.m_Category }, { "minimum", i_rSetting.m_Minimum }, { "maximum", i_rSetting.m_Maximum },
    { "allowed", i_rSetting.m_Allowed }, { "read_only", i_rSetting.m_bReadOnly }, { "verify_required", i_rSetting.m_bVerifyRequired },
    { "not_serialized", i_rSetting.m_bNotSerialized }, { "hidden", i_rSetting.m_bHidden }, { "advanced", i_rSetting.m_bAdvanced },
    { "ticks", i_rSetting.m_bInTicks }, { "saved", IsSaved( i_rSetting, i_rSaved ) } };
}

// One table for all, so that its columns stand under each other; the headings are put between its lines.
std::string ToTree( const std::vector<VSettingInfo>& i_rSettings, const std::vector<VDataPath>& i_rSaved )
{
  VTextTable Table( { "  SETTING", "VALUE", "PROPOSED", "TAKES", "FLAGS", "DESCRIPTION" } );
  std::vector<std::string> Headings;
  for( const std::string& rGroup : Groups( i_rSettings ) )
  {
    std::string Heading = rGroup;
    for( const VSettingInfo& rSetting : i_rSettings )
    {
      if( GroupOf( rSetting ) == rGroup )
      {
        const std::vector<std::string> Accepted = AcceptedTexts( rSetting );
        Headings.push_back( std::exchange( Heading, "" ) );
        Table.AddRow( { "  " + VDataPath::FromString( rSetting.m_Path ).Name(), ValueText( rSetting.m_Value ),
          rSetting.m_Proposed == rSetting.m_Value ? "" : ValueText( rSetting.m_Proposed ), Accepted.front(),
          JoinTexts( Flags( rSetting, i_rSaved ), " " ), rSetting.m_Description } );
        for( size_t Index = 1; Index < Accepted.size(); ++Index )
        {
          Headings.emplace_back();
          Table.AddRow( { "", "", "", Accepted[Index] } );
        }
      }
    }
  }
  std::istringstream Lines( Table.ToText() );
  std::string Line;
  std::getline( Lines, Line );
  std::string Text = Line + "\n";
  for( const std::string& rHeading : Headings )
  {
    std::getline( Lines, Line );
    Text += ( rHeading.empty() ? "" : rHeading + "\n" ) + Line + "\n";
  }
  return Text;
}
