// 4:2:2, two pixels a texel: y0 u y1 v, or u y0 v y1.

#ifdef GL_FRAGMENT_PRECISION_HIGH
precision highp float;   // half of its bits do not tell pixels apart
#endif

varying vec2 v_TextureCoordinate;

uniform sampler2D t_DiffuseTexture;
uniform vec2 u_Resolution;   // pixels of the texture
uniform bool u_Swizzle;

void main()
{
  if( any( lessThan( v_TextureCoordinate, vec2( 0.0 ) ) ) || any( greaterThan( v_TextureCoordinate, vec2( 1.0 ) ) ) )
  {
    discard;
  }
  vec2 Pixel = 1.0 / u_Resolution;
  vec2 C = v_TextureCoordinate - mod( v_TextureCoordinate, Pixel ) + 0.5 * Pixel;
  float Alternate = mod( C.x, 2.0 * Pixel.x );
  vec4 Pair = texture2D( t_DiffuseTexture, C );
  if( u_Swizzle )
  {
    Pair = Pair.yxwz;
  }
  float Y = Alternate > Pixel.x ? Pair.z : Pair.x;
  float U = Pair.y - 0.5;
  float V = Pair.w - 0.5;
  gl_FragColor = vec4( Y + 1.403 * V, Y - 0.344 * U - 0.714 * V, Y + 1.770 * U, 0.5 );
}
