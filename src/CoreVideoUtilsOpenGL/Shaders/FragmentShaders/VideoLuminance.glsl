// Grey.

#ifdef GL_FRAGMENT_PRECISION_HIGH
precision highp float;   // half of its bits do not tell pixels apart
#endif

varying vec2 v_TextureCoordinate;

uniform sampler2D t_DiffuseTexture;

void main()
{
  if( any( lessThan( v_TextureCoordinate, vec2( 0.0 ) ) ) || any( greaterThan( v_TextureCoordinate, vec2( 1.0 ) ) ) )
  {
    discard;
  }
  gl_FragColor = vec4( texture2D( t_DiffuseTexture, v_TextureCoordinate ).rrr, 0.5 );
}
