#pragma once

#include "orvo/ogl/ExceptionOGL.h"
#include "tests/support/Expect.h"

// The statement must throw exactly OGL::ExceptionOGL with exactly the given message.
#define ORVO_EXPECT_OGL(statement, text) ORVO_EXPECT_THROW_MESSAGE(statement, ::ORVO::OGL::ExceptionOGL, text)
