// Lighting of all surfaces: key light with shadow, ambient light, tone mapping.

uniform vec3 lightDirection; // towards the light
uniform mat4 toLight;        // from world space to the clip space of the shadow map
uniform float shadowBlur;    // radius of the penumbra, in texture coordinates of the shadow map
uniform sampler2DShadow shadowMap;

const vec3 kKeyColour = vec3(1.00, 0.94, 0.86) * 2.35;
const vec3 kSkyColour = vec3(0.70, 0.77, 0.88) * 0.58;
const vec3 kBounceColour = vec3(0.50, 0.44, 0.38) * 0.36;

// Samples on a sunflower spiral, which covers the disc evenly.
const int kShadowTaps = 16;
const float kGoldenAngle = 2.39996323;

// Returns the fraction of the key light that reaches a point: 0 in full shadow, 1 in full light.
float keyVisibility(vec3 point)
{
    vec3 place = (toLight * vec4(point, 1.0)).xyz * 0.5 + 0.5;
    if (any(lessThan(place, vec3(0.0))) || any(greaterThan(place, vec3(1.0))))
        return 1.0;
    // A rotation by pixel turns banding from the few samples into noise.
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

// Returns the light of the sky from above and the reflection of the ground from below.
vec3 ambientLight(vec3 normal)
{
    return mix(kBounceColour, kSkyColour, 0.5 + 0.5 * normal.y);
}

vec3 toLinear(vec3 srgb)
{
    return pow(srgb, vec3(2.2));
}

// Applies tone mapping and gamma encoding.
vec3 toScreen(vec3 light)
{
    return pow(light / (light + 0.85) * 1.28, vec3(1.0 / 2.2));
}
