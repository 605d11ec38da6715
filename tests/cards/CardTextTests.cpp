// What a card can be told, and how it refuses what it does not understand.
#include "cards/common/CardSpec.h"
#include "cards/common/EventScript.h"

#include <gtest/gtest.h>

using namespace VirtualCards;
using KVZ::IVideoStandard;

namespace
{

const VCardKind& DeckLink() { return *FindCardKind( "decklink" ); }

VCardSpec Parsed( const std::string& i_rText )
{
  std::string Error;
  const std::optional<VCardSpec> Spec = ParseCardSpec( i_rText, Error );
  EXPECT_TRUE( Spec ) << Error;
  return Spec.value_or( VCardSpec() );
}

void ExpectWords( const std::string& i_rError, const std::vector<std::string>& i_rWords )
{
  EXPECT_EQ( i_rError.find( '\n' ), std::string::npos );
  for( const std::string& rWord : i_rWords )
  {
    EXPECT_NE( i_rError.find( rWord ), std::string::npos ) << i_rError << "\n  lacks: " << rWord;
  }
}

void ExpectRefusal( const std::string& i_rText, const std::vector<std::string>& i_rWords )
{
  std::string Error;
  EXPECT_FALSE( ParseCardSpec( i_rText, Error ) ) << i_rText;
  ExpectWords( Error, i_rWords );
}

void ExpectScriptRefusal( const std::string& i_rText, const std::vector<std::string>& i_rWords )
{
  std::string Error;
  EXPECT_FALSE( ParseEvents( DeckLink(), DefaultStandard, i_rText, Error ) ) << i_rText;
  ExpectWords( Error, i_rWords );
}

}

TEST( CardText, EveryKeyIsTaken )
{
  const VCardSpec Spec = Parsed(
    "decklink:standard=HD_1280_720P_5994,pattern=counter,timecode=23:59:00;02,audio=ramp,channels=8,script=/tmp/a=b:c.json,speed=2.5" );
  EXPECT_EQ( Spec.m_Standard, IVideoStandard::EHD_1280_720P_5994 );
  EXPECT_EQ( Spec.m_Pattern, EPattern::Counter );
  EXPECT_EQ( Spec.m_Timecode->m_Hours, 23 );
  EXPECT_TRUE( Spec.m_Timecode->m_bDropFrame );
  EXPECT_EQ( Spec.m_Audio, EAudio::Ramp );
  EXPECT_EQ( Spec.m_Channels, 8u );
  EXPECT_EQ( Spec.m_Script, "/tmp/a=b:c.json" );
  EXPECT_DOUBLE_EQ( Spec.m_Speed, 2.5 );

  const VCardSpec Clip = Parsed( "decklink:timecode=none,loop=0,input=http://host:80/a,b=c.mov" );
  EXPECT_EQ( Clip.m_Input, "http://host:80/a,b=c.mov" ) << "it takes the rest";
  EXPECT_FALSE( Clip.m_Timecode );
  EXPECT_FALSE( Clip.m_bLoop );
}

TEST( CardText, RefusalsNameTheKeyTheReasonAndWhatIsAccepted )
{
  ExpectRefusal( "aja", { "\"aja\"", "accepted: decklink, bluefish444" } );
  ExpectRefusal( "decklink:", { "no key", "accepted: standard, pattern" } );
  ExpectRefusal( "decklink:colour=red", { "\"colour\"", "accepted: standard, pattern, timecode, audio, channels, script, speed, loop, input" } );
  ExpectRefusal( "decklink:pattern=", { "pattern: has no value" } );
  ExpectRefusal( "decklink:pattern=bars,pattern=noise", { "pattern: is given twice" } );
  ExpectRefusal( "decklink:pattern=plaid", { "pattern: \"plaid\"", "accepted: bars, counter, noise" } );
  ExpectRefusal( "decklink:audio=loud", { "audio: \"loud\"", "accepted: tone, ramp, silence, none" } );
  ExpectRefusal( "decklink:channels=17", { "channels: \"17\"", "1 to 16" } );
  ExpectRefusal( "decklink:speed=0", { "speed: \"0\"", "0.01 to 100" } );
  ExpectRefusal( "decklink:speed=nan", { "speed: \"nan\"" } );
  ExpectRefusal( "decklink:loop=2,input=a.mov", { "loop: \"2\"", "accepted: 1, 0" } );
  ExpectRefusal( "decklink:loop=0", { "loop:", "input" } );
  ExpectRefusal( "decklink:pattern=bars,input=a.mov", { "pattern:", "input" } );
  ExpectRefusal( "bluefish444:inputs=5", { "inputs: \"5\" is not understood; accepted: a whole number from 0 to 4" } );
  ExpectRefusal( "bluefish444:driver=ancient", { "accepted: new, old" } );
  ExpectRefusal( "bluefish444:standard=HD_2048_1556PSF_1500", { "cannot be carried by this kind of card" } );
  ExpectRefusal( "decklink:standard=HD_1920_1080P_4800", { "standard:", "cannot be carried", "SD_720_486I_5994", "HD_4096_2160P_2500" } );
  ExpectRefusal( "decklink:standard=PAL", { "standard:", "is no video standard", "SD_720_576I_5000" } );
}

TEST( CardText, ATimecodeMustFitTheRate )
{
  ExpectRefusal( "decklink:timecode=1:00:00:00", { "timecode: \"1:00:00:00\"", "HH:MM:SS;FF", "none" } );
  ExpectRefusal( "decklink:timecode=24:00:00:00", { "timecode:" } );
  ExpectRefusal( "decklink:timecode=01:00:00:25", { "timecode:", "00 to 24" } );
  ExpectRefusal( "decklink:timecode=01:00:00;00", { "timecode:", "29.97" } );
  ExpectRefusal( "decklink:standard=HD_1280_720P_5994,timecode=01:01:00;01", { "timecode:", "leaves out" } );
  Parsed( "decklink:timecode=01:00:00;00,standard=HD_1920_1080P_2997" );
  Parsed( "decklink:timecode=01:00:00;00,input=unknown-yet.mov" );
}

TEST( EventScript, RefusalsNameTheEventOrTheLine )
{
  ExpectScriptRefusal( "[\n{ \"frame\": 1,\n}]", { "line 3" } );
  ExpectScriptRefusal( "{}", { "list" } );
  ExpectScriptRefusal( R"([{ "frame": 1, "do": "remove" }, 7])", { "event 1:", "object" } );
  ExpectScriptRefusal( R"([{ "frame": 1 }])", { "event 0: \"do\": is missing" } );
  ExpectScriptRefusal( R"([{ "do": "remove" }])", { "\"frame\": is missing", "0 to" } );
  ExpectScriptRefusal( R"([{ "frame": 1.5, "do": "remove" }])", { "\"frame\": cannot be 1.5" } );
  ExpectScriptRefusal( R"([{ "frame": 1, "do": "drop", "frames": 0 }])", { "\"frames\": cannot be 0" } );
  ExpectScriptRefusal( R"([{ "frame": 1, "do": "remove", "frames": 3 }])", { "\"frames\"", "no such key", "accepted: do, frame" } );
  ExpectScriptRefusal( R"([{ "frame": 1, "do": "late", "milliseconds": "40" }])", { "\"milliseconds\": cannot be \"40\"" } );
  ExpectScriptRefusal( R"([{ "frame": 1, "do": "format", "standard": "HD_1920_1080P_4800" }])",
    { "\"standard\"", "cannot be carried", "accepted:" } );
  ExpectScriptRefusal( R"([{ "frame": 1, "do": "timecode-jump", "to": "noon" }])", { "\"to\": \"noon\"", "HH:MM:SS:FF" } );
}

TEST( EventScript, AJumpMustFitTheRateThatTheSignalHasByThen )
{
  const std::string Jump = R"({ "frame": 9, "do": "timecode-jump", "to": "01:00:00:29" })";
  ExpectScriptRefusal( "[" + Jump + "]", { "event 0: \"to\"", "00 to 24" } );
  std::string Error;
  EXPECT_TRUE(
    ParseEvents( DeckLink(), DefaultStandard, "[" + Jump + R"(, { "frame": 5, "do": "format", "standard": "HD_1920_1080P_6000" }])", Error ) )
    << Error;
}

TEST( EventScript, OneEventByHandHasNoFrame )
{
  std::string Error;
  EXPECT_TRUE( ParseEvent( DeckLink(), DefaultStandard, R"({ "do": "drop", "frames": 3 })", Error ) ) << Error;
  EXPECT_FALSE( ParseEvent( DeckLink(), DefaultStandard, R"({ "frame": 3, "do": "remove" })", Error ) );
  EXPECT_FALSE( ParseEvent( DeckLink(), DefaultStandard, "{", Error ) );
}
