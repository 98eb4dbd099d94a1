// A rendered scene seen twice, with the homography between the views known.
#ifndef KEL_EXAMPLES_SCENE_H
#define KEL_EXAMPLES_SCENE_H

#include <kel/kelMat.h>

#include "Picture.h"

namespace kel_examples {

struct Scene {
    Image first, second;
    kelMat H; // first to second
};

// 640x480 each: a wall of coloured shapes, the second view turned, tilted and a little darker.
Scene renderScene(unsigned seed);

} // namespace kel_examples

#endif
