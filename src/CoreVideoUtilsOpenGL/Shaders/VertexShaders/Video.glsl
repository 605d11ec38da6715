// Places the image's mesh: undoes the lens, rotates, looks at it through the view. The image itself is sampled in its own coordinates, so a
// finer mesh gives a finer warp.

#ifdef GL_ES
precision highp float;   // half of its bits do not hold the square of a distance in pixels
#endif

attribute vec2 a_Position;   // 0 to 1, from the image's left and first row

uniform bool u_Inverted;
uniform vec4 u_VideoScaleAndOffset;   // of the image within the texture: xy scale, zw offset
uniform vec4 u_View2D;                // xy scale, zw offset
uniform vec2 u_RadialDistortionCentre;   // (0, 0) for no correction
uniform vec3 u_RadialDistortionParameters;
uniform mat2 u_Rotation;
uniform vec2 u_RotationCentre;
uniform vec2 u_SensorSize;

varying vec2 v_TextureCoordinate;

vec2 UndoLens( vec2 i_Pixel )
{
  vec2 Ray = i_Pixel - u_RadialDistortionCentre;
  float D = dot( Ray, Ray );
  vec3 K = u_RadialDistortionParameters;
  return Ray * ( 1.0 + D * ( K.x + D * ( K.y + D * K.z ) ) ) + u_RadialDistortionCentre;
}

void main()
{
  vec2 Position = a_Position;
  if( u_RadialDistortionCentre != vec2( 0.0 ) )
  {
    Position = UndoLens( Position * u_SensorSize ) / u_SensorSize;
  }
  Position = ( u_Rotation * ( Position * u_SensorSize - u_RotationCentre ) + u_RotationCentre ) / u_SensorSize;

  vec2 Clip = Position - u_View2D.zw;
  Clip.y = -Clip.y;
  gl_Position = vec4( Clip * 2.0 * u_View2D.xy, 0.0, 1.0 );

  vec2 Coordinate = a_Position;
  if( u_Inverted )
  {
    Coordinate.y = 1.0 - Coordinate.y;
  }
  v_TextureCoordinate = ( Coordinate + u_VideoScaleAndOffset.zw ) * u_VideoScaleAndOffset.xy;
}
