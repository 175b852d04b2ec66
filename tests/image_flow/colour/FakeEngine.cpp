#include "tests/image_flow/colour/FakeEngine.h"

#include "orvo/image_flow/colour/QuorClient.h"

#include <gtest/gtest.h>

namespace ORVO::Test {

FakeBinding::FakeBinding() {
    FakeEngine::reset();
    EXPECT_EQ(1, ImageFlow::QuorClient::start(&FakeEngine::address));
    FakeEngine::asked().clear();
}

FakeBinding::~FakeBinding() { ImageFlow::QuorClient::stop(); }

} // namespace ORVO::Test
