#include "CoreGraphics/Shader.h"

#include "StageCoreRuntime/GlobalLog.h"

#include <QtCore/QFile>
#include <QtGui/QOpenGLContext>

#include <algorithm>
#include <vector>

namespace CoreGraphics
{

namespace
{

constexpr char LogCategory[] = "CoreVideoUtilsOpenGL";

QOpenGLFunctions& CurrentFunctions() { return *QOpenGLContext::currentContext()->functions(); }

bool IsOpenGLES() { return QOpenGLContext::currentContext()->isOpenGLES(); }

// Without the zero and the line end that drivers close it with.
std::string Trim( std::vector<char> i_Text )
{
  const auto End = std::find( i_Text.begin(), i_Text.end(), '\0' );
  std::string Text( i_Text.begin(), End );
  Text.erase( Text.find_last_not_of( " \n" ) + 1 );
  return Text;
}

}

bool LoadShaderFile( const std::string& i_rPath, bool i_bOpenGLES, std::string& o_rSource )
{
  QFile File( QString::fromStdString( i_rPath ) );
  if( !File.open( QIODevice::ReadOnly ) )
  {
    KVZ_LOG_ERROR( LogCategory, "Failed to open %1%", i_rPath );
    return false;
  }
  KVZ_LOG_DETAIL( LogCategory, "Loading shader file %1%", i_rPath );
  o_rSource = i_bOpenGLES ? "#version 100\n" : "#version 120\n";
  o_rSource += "#ifdef GL_ES\nprecision mediump float;\n#endif\n#line 1\n";
  o_rSource += File.readAll().toStdString();
  return true;
}

VShader::VShader( GLenum i_Stage, const std::string& i_rPath ) : m_rFunctions( CurrentFunctions() )
{
  std::string Source;
  if( !LoadShaderFile( i_rPath, IsOpenGLES(), Source ) )
  {
    return;
  }
  m_Id = m_rFunctions.glCreateShader( i_Stage );
  const char* pSource = Source.c_str();
  m_rFunctions.glShaderSource( m_Id, 1, &pSource, nullptr );
  m_rFunctions.glCompileShader( m_Id );
  GLint Compiled = 0;
  m_rFunctions.glGetShaderiv( m_Id, GL_COMPILE_STATUS, &Compiled );
  if( Compiled != 0 )
  {
    return;
  }
  GLint Length = 0;
  m_rFunctions.glGetShaderiv( m_Id, GL_INFO_LOG_LENGTH, &Length );
  std::vector<char> Log( static_cast<size_t>( Length ) + 1 );
  m_rFunctions.glGetShaderInfoLog( m_Id, Length, nullptr, Log.data() );
  KVZ_LOG_ERROR( LogCategory, "Shader Failed To Compile<%1%> Log=<%2%>", i_rPath, Trim( std::move( Log ) ) );
  m_rFunctions.glDeleteShader( m_Id );
  m_Id = 0;
}

VShader::~VShader() { m_rFunctions.glDeleteShader( m_Id ); }

VShaderProgram::VShaderProgram( const std::string& i_rVertexPath, const std::string& i_rFragmentPath ) : m_rFunctions( CurrentFunctions() )
{
  const VShader Vertex( GL_VERTEX_SHADER, i_rVertexPath );
  const VShader Fragment( GL_FRAGMENT_SHADER, i_rFragmentPath );
  if( Vertex.IsValid() && Fragment.IsValid() )
  {
    Link( Vertex, Fragment );
  }
}

VShaderProgram::~VShaderProgram() { m_rFunctions.glDeleteProgram( m_Id ); }

void VShaderProgram::Link( const VShader& i_rVertex, const VShader& i_rFragment )
{
  m_Id = m_rFunctions.glCreateProgram();
  m_rFunctions.glAttachShader( m_Id, i_rVertex.Id() );
  m_rFunctions.glAttachShader( m_Id, i_rFragment.Id() );
  m_rFunctions.glBindAttribLocation( m_Id, PositionAttribute, "a_Position" );
  m_rFunctions.glLinkProgram( m_Id );
  GLint Linked = 0;
  m_rFunctions.glGetProgramiv( m_Id, GL_LINK_STATUS, &Linked );
  if( Linked != 0 )
  {
    return;
  }
  GLint Length = 0;
  m_rFunctions.glGetProgramiv( m_Id, GL_INFO_LOG_LENGTH, &Length );
  std::vector<char> Log( static_cast<size_t>( Length ) + 1 );
  m_rFunctions.glGetProgramInfoLog( m_Id, Length, nullptr, Log.data() );
  KVZ_LOG_ERROR( LogCategory, "A shader program could not be linked: %1%", Trim( std::move( Log ) ) );
  m_rFunctions.glDeleteProgram( m_Id );
  m_Id = 0;
}

void VShaderProgram::Use() { m_rFunctions.glUseProgram( m_Id ); }

GLint VShaderProgram::Find( const char* i_pName ) { return m_rFunctions.glGetUniformLocation( m_Id, i_pName ); }

void VShaderProgram::Set( const char* i_pName, bool i_bValue ) { m_rFunctions.glUniform1i( Find( i_pName ), i_bValue ? 1 : 0 ); }

void VShaderProgram::Set( const char* i_pName, int i_Value ) { m_rFunctions.glUniform1i( Find( i_pName ), i_Value ); }

void VShaderProgram::Set( const char* i_pName, const std::array<float, 2>& i_rValue )
{
  m_rFunctions.glUniform2fv( Find( i_pName ), 1, i_rValue.data() );
}

void VShaderProgram::Set( const char* i_pName, const std::array<float, 3>& i_rValue )
{
  m_rFunctions.glUniform3fv( Find( i_pName ), 1, i_rValue.data() );
}

void VShaderProgram::Set( const char* i_pName, const std::array<float, 4>& i_rValue )
{
  m_rFunctions.glUniform4fv( Find( i_pName ), 1, i_rValue.data() );
}

void VShaderProgram::SetMatrix2( const char* i_pName, const std::array<float, 4>& i_rColumns )
{
  m_rFunctions.glUniformMatrix2fv( Find( i_pName ), 1, GL_FALSE, i_rColumns.data() );
}

}
