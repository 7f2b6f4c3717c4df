// What the surfaces share: the key light with its shadow, the sky, and the way to the screen.

uniform vec3 lightDirection; // towards the light
uniform mat4 toLight;        // from the stage to the shadow map's clip space
uniform float shadowBlur;    // radius of the penumbra, in parts of the shadow map
uniform sampler2DShadow shadowMap;

const vec3 kKeyColour = vec3(1.00, 0.94, 0.86) * 2.35;
const vec3 kSkyColour = vec3(0.70, 0.77, 0.88) * 0.58;
const vec3 kBounceColour = vec3(0.50, 0.44, 0.38) * 0.36;

// Points of a sunflower: even over the disc.
const int kShadowTaps = 16;
const float kGoldenAngle = 2.39996323;

// The part of the key light that reaches a point: 0 in full shadow, 1 in the open.
float keyVisibility(vec3 point)
{
    vec3 place = (toLight * vec4(point, 1.0)).xyz * 0.5 + 0.5;
    if (any(lessThan(place, vec3(0.0))) || any(greaterThan(place, vec3(1.0))))
        return 1.0;
    // Turned differently at neighbouring pixels, the few points look like many.
    float turn = fract(52.9829189 * fract(dot(gl_FragCoord.xy, vec2(0.06711056, 0.00583715))));
    float visible = 0.0;
    for (int i = 0; i < kShadowTaps; ++i) {
        float radius = shadowBlur * sqrt((float(i) + 0.5) / float(kShadowTaps));
        float angle = kGoldenAngle * float(i) + 6.2831853 * turn;
        vec2 offset = radius * vec2(cos(angle), sin(angle));
        visible += texture(shadowMap, vec3(place.xy + offset, place.z));
    }
    return visible / float(kShadowTaps);
}

// The sky from above, the light ground's reflection from below.
vec3 ambientLight(vec3 normal)
{
    return mix(kBounceColour, kSkyColour, 0.5 + 0.5 * normal.y);
}

vec3 toLinear(vec3 srgb)
{
    return pow(srgb, vec3(2.2));
}

// Compresses bright light gently and encodes for the screen.
vec3 toScreen(vec3 light)
{
    return pow(light / (light + 0.85) * 1.28, vec3(1.0 / 2.2));
}
