// Shaders and the programs made of them, in the language of OpenGL 2.1 or OpenGL ES 2.0.
//
// Everything here belongs to the OpenGL context that is current when it is made, and is used and destroyed with that context current.
#pragma once

#include <QtGui/QOpenGLFunctions>

#include <array>
#include <string>

namespace CoreGraphics
{

// Reads a whole shader file, which may be a resource (":/Folder/Name"), and puts the header before it that this context's language needs.
// False, with a line in the log, if it cannot be opened.
bool LoadShaderFile( const std::string& i_rPath, bool i_bOpenGLES, std::string& o_rSource );

// One compiled stage.
class VShader
{
public:
  // i_Stage is GL_VERTEX_SHADER or GL_FRAGMENT_SHADER. What goes wrong is said in the log, and the shader stays invalid.
  VShader( GLenum i_Stage, const std::string& i_rPath );
  ~VShader();
  VShader( const VShader& ) = delete;
  VShader& operator=( const VShader& ) = delete;

  bool IsValid() const { return m_Id != 0; }
  GLuint Id() const { return m_Id; }

private:
  QOpenGLFunctions& m_rFunctions;
  GLuint m_Id = 0;
};

// A vertex and a fragment stage, linked. Vertices have one attribute, "a_Position" of two components at place 0.
class VShaderProgram
{
public:
  static constexpr GLuint PositionAttribute = 0;

  VShaderProgram( const std::string& i_rVertexPath, const std::string& i_rFragmentPath );
  ~VShaderProgram();
  VShaderProgram( const VShaderProgram& ) = delete;
  VShaderProgram& operator=( const VShaderProgram& ) = delete;

  bool IsValid() const { return m_Id != 0; }

  // Draws with this program until another one is used. Needs a valid program, as do the setters, which need it in use. A uniform that the
  // program does not have is left out.
  void Use();
  void Set( const char* i_pName, bool i_bValue );
  void Set( const char* i_pName, int i_Value );
  void Set( const char* i_pName, const std::array<float, 2>& i_rValue );
  void Set( const char* i_pName, const std::array<float, 3>& i_rValue );
  void Set( const char* i_pName, const std::array<float, 4>& i_rValue );
  // Column by column
  void SetMatrix2( const char* i_pName, const std::array<float, 4>& i_rColumns );

private:
  GLint Find( const char* i_pName );
  void Link( const VShader& i_rVertex, const VShader& i_rFragment );

  QOpenGLFunctions& m_rFunctions;
  GLuint m_Id = 0;
};

}
