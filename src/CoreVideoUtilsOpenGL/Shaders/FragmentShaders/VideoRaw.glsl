// Red, green and blue as they are, or the other way round.

#ifdef GL_FRAGMENT_PRECISION_HIGH
precision highp float;   // half of its bits do not tell pixels apart
#endif

varying vec2 v_TextureCoordinate;

uniform sampler2D t_DiffuseTexture;
uniform bool u_Swizzle;

void main()
{
  if( any( lessThan( v_TextureCoordinate, vec2( 0.0 ) ) ) || any( greaterThan( v_TextureCoordinate, vec2( 1.0 ) ) ) )
  {
    discard;
  }
  vec3 Colour = texture2D( t_DiffuseTexture, v_TextureCoordinate ).rgb;
  gl_FragColor = vec4( u_Swizzle ? Colour.bgr : Colour, 0.5 );
}
