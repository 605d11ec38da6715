// Demosaics with a gradient-corrected filter of five by five pixels, then corrects gamma and saturation.

#ifdef GL_FRAGMENT_PRECISION_HIGH
precision highp float;   // half of its bits do not tell pixels apart
#endif

varying vec2 v_TextureCoordinate;

uniform sampler2D t_DiffuseTexture;
uniform vec2 u_FirstRed;     // where the first red pixel lies
uniform vec2 u_Resolution;   // pixels of the texture
uniform vec2 u_ColourCorrection;   // gamma, saturation

const vec4 kA = vec4( -1.0, -1.5, 0.5, -1.0 ) / 8.0;
const vec4 kB = vec4( 2.0, 0.0, 0.0, 4.0 ) / 8.0;
const vec4 kC = vec4( 4.0, 6.0, 5.0, 5.0 ) / 8.0;
const vec4 kD = vec4( 0.0, 2.0, -1.0, -1.0 ) / 8.0;
const vec4 kE = kA.xywz;
const vec4 kF = kB.xywz;

float Sample( vec2 i_Centre, float i_X, float i_Y )
{
  return texture2D( t_DiffuseTexture, i_Centre + vec2( i_X, i_Y ) / u_Resolution ).r;
}

// What is brighter or darker than the picture can be is cut off first: a power of it would have no meaning, and the software corrector has
// nothing but bytes to work with.
vec3 CorrectColour( vec3 i_Colour )
{
  vec3 Colour = pow( clamp( i_Colour, 0.0, 1.0 ), vec3( 1.0 / u_ColourCorrection.x ) );
  float Amount = u_ColourCorrection.y - 1.0;
  float Grey = dot( max( Colour, 0.0 ), vec3( 1.0 / 3.0 ) );
  return mix( Colour, vec3( Grey ), min( -Amount, 1.0 ) );
}

void main()
{
  if( any( lessThan( v_TextureCoordinate, vec2( 0.0 ) ) ) || any( greaterThan( v_TextureCoordinate, vec2( 1.0 ) ) ) )
  {
    discard;
  }
  vec2 Pixel = 1.0 / u_Resolution;
  vec2 Centre = v_TextureCoordinate - mod( v_TextureCoordinate, Pixel ) + 0.5 * Pixel;
  vec2 Alternate = mod( floor( Centre * u_Resolution + u_FirstRed ), 2.0 );

  float C = Sample( Centre, 0.0, 0.0 );
  float D = Sample( Centre, -1.0, -1.0 ) + Sample( Centre, -1.0, 1.0 ) + Sample( Centre, 1.0, -1.0 ) + Sample( Centre, 1.0, 1.0 );
  float A = Sample( Centre, 0.0, -2.0 ) + Sample( Centre, 0.0, 2.0 );
  float B = Sample( Centre, 0.0, -1.0 ) + Sample( Centre, 0.0, 1.0 );
  float E = Sample( Centre, -2.0, 0.0 ) + Sample( Centre, 2.0, 0.0 );
  float F = Sample( Centre, -1.0, 0.0 ) + Sample( Centre, 1.0, 0.0 );

  vec4 P = ( kC.xyz * C ).xyzz;
  P.yzw += ( kD.yz * D ).xyy;
  P += ( kA.xyz * A ).xyzx + ( kE.xyw * E ).xyxz;
  P.xw += kB.xw * B;
  P.xz += kF.xz * F;

  vec3 Colour;
  if( Alternate.y == 0.0 )
  {
    Colour = Alternate.x == 0.0 ? vec3( C, P.x, P.y ) : vec3( P.z, C, P.w );
  }
  else
  {
    Colour = Alternate.x == 0.0 ? vec3( P.w, C, P.z ) : vec3( P.y, P.x, C );
  }
  gl_FragColor = vec4( CorrectColour( Colour ), 0.5 );
}
