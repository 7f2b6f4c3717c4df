__kernel void broken(__global float* data)
{
    data[get_global_id(0)] = undeclared_amount;
}
