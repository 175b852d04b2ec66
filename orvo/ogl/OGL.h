/// Everything of the OpenGL object layer.
#pragma once

#include "orvo/ogl/Context.h"
#include "orvo/ogl/OGLLibrary.h"
