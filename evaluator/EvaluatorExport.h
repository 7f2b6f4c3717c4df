// The export macro of the evaluator's public interface.
#pragma once

#if defined(_WIN32)
#if defined(VYRA_EVALUATOR_BUILDING)
#define VYRA_EVALUATOR_API __declspec(dllexport)
#elif defined(VYRA_EVALUATOR_STATIC)
#define VYRA_EVALUATOR_API
#else
#define VYRA_EVALUATOR_API __declspec(dllimport)
#endif
#else
#define VYRA_EVALUATOR_API __attribute__((visibility("default")))
#endif
